// The reference host's sources and clips, the containers that hold them, and the operators
// stacked on objects.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include <ut/host/reference_scene.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/components.h>
#include <ut/sdk/shaders.h>
#include <ut/sdk/sources.h>

namespace ut::host {

// A source (with its file) or a clip (with the source it uses). Both answer IPersist,
// IGWNamedObject and IGWActiveData (its flags; it holds nothing the other operations reach).
class MediaItem final
    : public ut::sdk::ComObject<IPersist, IGWNamedObject, IGWActiveData, I3DSource, I3DClip> {
public:
    MediaItem(const SourceDescription& source);
    MediaItem(const ClipDescription& clip, ut::ComPtr<MediaItem> source);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetClassID(CLSID* clsid) override;
    HRESULT STDMETHODCALLTYPE GetNameSpace(I3DGenericNameSpace** current) override;
    HRESULT STDMETHODCALLTYPE GetPreferredNameSpace(I3DGenericNameSpace** preferred) override;
    HRESULT STDMETHODCALLTYPE GetName(wchar_t** name) override;
    HRESULT STDMETHODCALLTYPE GetFlags(ULONG* flags) override;
    HRESULT STDMETHODCALLTYPE FindParameter(REFGUID id, tagGWComponent* parameter) override;
    HRESULT STDMETHODCALLTYPE QueryObjects(ULONG query, ULONG scope, ULONG depth, REFGUID filter, REFIID iid,
                                           IGWEnumObjects** objects) override;
    HRESULT STDMETHODCALLTYPE ResolveObject(IUnknown* object, ULONG* handle) override;
    HRESULT STDMETHODCALLTYPE GetComponentRecord(ULONG handle, tagGWComponent* component) override;
    HRESULT STDMETHODCALLTYPE CheckComponent(const tagGWComponent& component) override;
    HRESULT STDMETHODCALLTYPE FollowUp(const tagGWComponent& component, ULONG* handle) override;
    HRESULT STDMETHODCALLTYPE FetchObject(ULONG handle, LONG index, REFIID iid, void** object) override;
    HRESULT STDMETHODCALLTYPE GetPath(wchar_t** path) override;
    HRESULT STDMETHODCALLTYPE GetSource(REFIID iid, void** source) override;

    const std::wstring& Name() const { return name_; }
    SourceDescription DescribeSource() const { return {clsid_, name_, path_, hidden_}; }
    ClipDescription DescribeClip() const;

private:
    bool clip_;
    CLSID clsid_;
    std::wstring name_;
    std::wstring path_;
    bool hidden_;
    ut::ComPtr<MediaItem> source_;
};

// The sources or the clips of the scene, in order.
class MediaContainer final : public ut::sdk::ComObject<I3DSourceClipContainer> {
public:
    explicit MediaContainer(std::vector<ut::ComPtr<MediaItem>> members) : members_(std::move(members)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE EnumChildren(REFGUID filter, REFIID iid, IGWEnumObjects** children) override;

    const std::vector<ut::ComPtr<MediaItem>>& Members() const { return members_; }
    MediaItem* Find(const std::wstring& name) const;

private:
    std::vector<ut::ComPtr<MediaItem>> members_;
};

// Appends to `answered`, through `iid`, each of `members` whose class is `filter` (GUID_NULL:
// every one), in order.
template <class Member>
void AppendOfClass(const std::vector<ut::ComPtr<Member>>& members, REFGUID filter, REFIID iid,
                   std::vector<ut::ComPtr<IUnknown>>& answered) {
    for (const ut::ComPtr<Member>& member : members) {
        CLSID clsid = GUID_NULL;
        ut::ComPtr<IUnknown> one;
        if ((IsEqualGUID(filter, GUID_NULL) ||
             (SUCCEEDED(member->GetClassID(&clsid)) && IsEqualGUID(clsid, filter))) &&
            SUCCEEDED(member->QueryInterface(iid, one.PutVoid())))
            answered.push_back(std::move(one));
    }
}

// The sources and clips containers a scene description describes; false when memory ran out.
bool BuildMedia(const SceneDescription& description, ut::ComPtr<MediaContainer>& sources,
                ut::ComPtr<MediaContainer>& clips);

// An operator on an object's stack: only its class.
class StackedOperator final : public ut::sdk::ComObject<IPersist> {
public:
    explicit StackedOperator(const CLSID& clsid) : clsid_(clsid) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetClassID(CLSID* clsid) override;

private:
    CLSID clsid_;
};

} // namespace ut::host
