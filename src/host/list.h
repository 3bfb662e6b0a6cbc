// The reference host's lists: element references that point at objects (or components in them),
// the creatable list that holds them in order, the enumeration of a list, and objects handed out
// one at a time.
#pragma once

#include <vector>

#include <ut/sdk/comobject.h>
#include <ut/sdk/components.h>
#include <ut/sdk/list.h>
#include <ut/sdk/scene.h>

namespace ut::host {

class ElemRef final : public ut::sdk::ComObject<I3DElemRef> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE SetTarget(IUnknown* object, const tagGWComponent* component) override;
    HRESULT STDMETHODCALLTYPE GetTarget(REFIID iid, void** object, LONG final) override;
    // E_UNEXPECTED while the element points at nothing.
    HRESULT STDMETHODCALLTYPE SetAsGroup(IUnknown* scene, I3DGroup* group) override;
    HRESULT STDMETHODCALLTYPE Update(LONG notify) override;

    // Points the element at `object` (the host's own lists do, without asking the fault hook).
    void Point(IUnknown* object) { target_ = ut::ComPtr<IUnknown>(object); }
    // The group the element stands for once updated.
    I3DGroup* Group() const { return group_.Get(); }

private:
    ut::ComPtr<IUnknown> target_;
    tagGWComponent component_{};
    ut::ComPtr<I3DGroup> pendingGroup_;
    ut::ComPtr<I3DGroup> group_;
};

class List final : public ut::sdk::ComObject<I3DList> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetCount(ULONG* count) override;
    HRESULT STDMETHODCALLTYPE GetItem(ULONG index, I3DElemRef** element) override;
    HRESULT STDMETHODCALLTYPE NewElement(REFIID iid, void** element) override;
    HRESULT STDMETHODCALLTYPE Append(I3DElemRef* element) override;
    HRESULT STDMETHODCALLTYPE EnumElements(IEnum3DElemRef** elements) override;

    // Appends an element pointing at `object`, without asking the fault hook: for the host's own
    // lists.
    HRESULT AppendTarget(IUnknown* object);

private:
    std::vector<ut::ComPtr<I3DElemRef>> elements_;
};

// A new list of `objects` in order, handed out through `list` (cleared first); S_FALSE when it
// is empty.
HRESULT HandOutList(const std::vector<IUnknown*>& objects, I3DList** list);
// Hands `objects` out one at a time through `objects` (cleared first).
HRESULT HandOutObjects(std::vector<ut::ComPtr<IUnknown>> objects, IGWEnumObjects** enumeration);

} // namespace ut::host
