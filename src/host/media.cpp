// The reference host's sources, clips and stacked operators.
#include "media.h"

#include <ut/sdk/testing.h>

#include "host_support.h"
#include "list.h"

namespace ut::host {
namespace {

// IPersist::GetClassID of a host object of class `own`.
HRESULT AnswerClass(const CLSID& own, CLSID* clsid) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IPersist::GetClassID"); FAILED(hr))
        return hr;
    if (!clsid)
        return E_POINTER;
    *clsid = own;
    return S_OK;
}

} // namespace

MediaItem::MediaItem(const SourceDescription& source)
    : clip_(false), clsid_(source.clsid), name_(source.name), path_(source.path), hidden_(source.hidden) {}

MediaItem::MediaItem(const ClipDescription& clip, ut::ComPtr<MediaItem> source)
    : clip_(true), clsid_(clip.clsid), name_(clip.name), hidden_(clip.hidden), source_(std::move(source)) {}

std::span<const CGWCOMObject::InterfaceEntry> MediaItem::GetInterfaceMap() const {
    static const InterfaceEntry source[] = {ut::sdk::Entry<MediaItem, IPersist>(IID_IPersist),
                                            ut::sdk::Entry<MediaItem, IGWNamedObject>(IID_IGWNamedObject),
                                            ut::sdk::Entry<MediaItem, IGWActiveData>(IID_IGWActiveData),
                                            ut::sdk::Entry<MediaItem, I3DSource>(IID_I3DSource)};
    static const InterfaceEntry clip[] = {ut::sdk::Entry<MediaItem, IPersist>(IID_IPersist),
                                          ut::sdk::Entry<MediaItem, IGWNamedObject>(IID_IGWNamedObject),
                                          ut::sdk::Entry<MediaItem, IGWActiveData>(IID_IGWActiveData),
                                          ut::sdk::Entry<MediaItem, I3DClip>(IID_I3DClip)};
    if (clip_)
        return clip;
    return source;
}

ClipDescription MediaItem::DescribeClip() const {
    return {clsid_, name_, source_ ? source_->Name() : std::wstring(), hidden_};
}

HRESULT MediaItem::GetClassID(CLSID* clsid) {
    return AnswerClass(clsid_, clsid);
}

HRESULT MediaItem::GetNameSpace(I3DGenericNameSpace** current) {
    if (!current)
        return E_POINTER;
    *current = nullptr;
    return S_FALSE;
}

HRESULT MediaItem::GetPreferredNameSpace(I3DGenericNameSpace** preferred) {
    return GetNameSpace(preferred);
}

HRESULT MediaItem::GetName(wchar_t** name) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWNamedObject::GetName"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] { return CopyToTaskMemory(name_, name); });
}

HRESULT MediaItem::GetFlags(ULONG* flags) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveData::GetFlags"); FAILED(hr))
        return hr;
    if (!flags)
        return E_POINTER;
    *flags = hidden_ ? GWACTIVEDATA_HIDDEN : 0;
    return S_OK;
}

HRESULT MediaItem::FindParameter(REFGUID, tagGWComponent*) {
    return DISP_E_MEMBERNOTFOUND;
}

HRESULT MediaItem::QueryObjects(ULONG, ULONG, ULONG, REFGUID, REFIID, IGWEnumObjects** objects) {
    if (objects)
        *objects = nullptr;
    return E_INVALIDARG;
}

HRESULT MediaItem::ResolveObject(IUnknown*, ULONG*) {
    return E_NOTIMPL;
}

HRESULT MediaItem::GetComponentRecord(ULONG, tagGWComponent*) {
    return E_NOTIMPL;
}

HRESULT MediaItem::CheckComponent(const tagGWComponent&) {
    return E_NOTIMPL;
}

HRESULT MediaItem::FollowUp(const tagGWComponent&, ULONG*) {
    return E_NOTIMPL;
}

HRESULT MediaItem::FetchObject(ULONG, LONG, REFIID, void** object) {
    if (object)
        *object = nullptr;
    return E_NOTIMPL;
}

HRESULT MediaItem::GetPath(wchar_t** path) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSource::GetPath"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] { return CopyToTaskMemory(path_, path); });
}

HRESULT MediaItem::GetSource(REFIID iid, void** source) {
    if (!source)
        return E_POINTER;
    *source = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DClip::GetSource"); FAILED(hr))
        return hr;
    return source_ ? source_->QueryInterface(iid, source) : S_FALSE;
}

std::span<const CGWCOMObject::InterfaceEntry> MediaContainer::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<MediaContainer, I3DSourceClipContainer>(IID_I3DSourceClipContainer)};
    return map;
}

HRESULT MediaContainer::EnumChildren(REFGUID filter, REFIID iid, IGWEnumObjects** children) {
    if (!children)
        return E_POINTER;
    *children = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DSourceClipContainer::EnumChildren"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::vector<ut::ComPtr<IUnknown>> answered;
        AppendOfClass(members_, filter, iid, answered);
        return HandOutObjects(std::move(answered), children);
    });
}

MediaItem* MediaContainer::Find(const std::wstring& name) const {
    for (const ut::ComPtr<MediaItem>& member : members_)
        if (member->Name() == name)
            return member.Get();
    return nullptr;
}

bool BuildMedia(const SceneDescription& description, ut::ComPtr<MediaContainer>& sources,
                ut::ComPtr<MediaContainer>& clips) {
    std::vector<ut::ComPtr<MediaItem>> members;
    for (const SourceDescription& source : description.sources) {
        members.push_back(Make<MediaItem>(source));
        if (!members.back())
            return false;
    }
    if (!(sources = Make<MediaContainer>(std::move(members))))
        return false;
    members.clear();
    for (const ClipDescription& clip : description.clips) {
        members.push_back(Make<MediaItem>(clip, ut::ComPtr<MediaItem>(sources->Find(clip.source))));
        if (!members.back())
            return false;
    }
    return static_cast<bool>(clips = Make<MediaContainer>(std::move(members)));
}

std::span<const CGWCOMObject::InterfaceEntry> StackedOperator::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<StackedOperator, IPersist>(IID_IPersist)};
    return map;
}

HRESULT StackedOperator::GetClassID(CLSID* clsid) {
    return AnswerClass(clsid_, clsid);
}

} // namespace ut::host
