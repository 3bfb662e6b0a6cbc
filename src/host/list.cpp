// The reference host's lists and element references.
#include "list.h"

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

namespace ut::host {
namespace {

// The elements of a list, handed out with a reference each.
struct Elements {
    using Interface = IEnum3DElemRef;
    using Kept = ut::ComPtr<I3DElemRef>;
    using Out = I3DElemRef*;
    static constexpr char kNext[] = "IEnum3DElemRef::Next";
    static HRESULT HandOut(const Kept& element, Out& out) { return element.CopyTo(&out); }
    static void Clear(Out& out) { std::exchange(out, nullptr)->Release(); }
};

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> ElemRef::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<ElemRef, I3DElemRef>(IID_I3DElemRef)};
    return map;
}

HRESULT ElemRef::SetTarget(IUnknown* object, const tagGWComponent* component) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DElemRef::SetTarget"); FAILED(hr))
        return hr;
    Point(object);
    component_ = component ? *component : tagGWComponent{};
    return S_OK;
}

HRESULT ElemRef::GetTarget(REFIID iid, void** object, LONG final) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DElemRef::GetTarget"); FAILED(hr))
        return hr;
    if (!target_)
        return S_FALSE;
    ut::ComPtr<I3DElemRef> further;
    if (final && SUCCEEDED(target_.As(further)))
        return further->GetTarget(iid, object, final);
    return target_->QueryInterface(iid, object);
}

HRESULT ElemRef::SetAsGroup(IUnknown* scene, I3DGroup* group) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DElemRef::SetAsGroup"); FAILED(hr))
        return hr;
    if (!scene)
        return E_POINTER;
    if (!target_)
        return E_UNEXPECTED;
    pendingGroup_ = ut::ComPtr<I3DGroup>(group);
    return S_OK;
}

HRESULT ElemRef::Update(LONG) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DElemRef::Update"); FAILED(hr))
        return hr;
    if (pendingGroup_)
        group_ = std::move(pendingGroup_);
    return S_OK;
}

std::span<const CGWCOMObject::InterfaceEntry> List::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<List, I3DList>(IID_I3DList)};
    return map;
}

HRESULT List::GetCount(ULONG* count) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DList::GetCount"); FAILED(hr))
        return hr;
    if (!count)
        return E_POINTER;
    *count = static_cast<ULONG>(elements_.size());
    return S_OK;
}

HRESULT List::GetItem(ULONG index, I3DElemRef** element) {
    if (!element)
        return E_POINTER;
    *element = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DList::GetItem"); FAILED(hr))
        return hr;
    return index < elements_.size() ? elements_[index].CopyTo(element) : DISP_E_BADINDEX;
}

HRESULT List::NewElement(REFIID iid, void** element) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DList::NewElement"); FAILED(hr))
        return hr;
    return HandOut(Make<ElemRef>(), iid, element);
}

HRESULT List::Append(I3DElemRef* element) {
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DList::Append"); FAILED(hr))
        return hr;
    if (!element)
        return E_POINTER;
    return ut::ExportBoundary([&] {
        elements_.emplace_back(element);
        return S_OK;
    });
}

HRESULT List::EnumElements(IEnum3DElemRef** elements) {
    if (!elements)
        return E_POINTER;
    *elements = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("I3DList::EnumElements"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        *elements = Make<Enumerator<Elements>>(elements_).Detach();
        return *elements ? S_OK : E_OUTOFMEMORY;
    });
}

HRESULT List::AppendTarget(IUnknown* object) {
    ut::ComPtr<ElemRef> element = Make<ElemRef>();
    if (!element)
        return E_OUTOFMEMORY;
    element->Point(object);
    return ut::ExportBoundary([&] {
        elements_.emplace_back(element.Get());
        return S_OK;
    });
}

HRESULT HandOutList(const std::vector<IUnknown*>& objects, I3DList** list) {
    if (!list)
        return E_POINTER;
    *list = nullptr;
    ut::ComPtr<List> made = Make<List>();
    if (!made)
        return E_OUTOFMEMORY;
    for (IUnknown* object : objects)
        if (HRESULT hr = made->AppendTarget(object); FAILED(hr))
            return hr;
    *list = made.Detach();
    return objects.empty() ? S_FALSE : S_OK;
}

namespace {

class ObjectEnum final : public ut::sdk::ComObject<IGWEnumObjects> {
public:
    explicit ObjectEnum(std::vector<ut::ComPtr<IUnknown>> objects) : objects_(std::move(objects)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {ut::sdk::Entry<ObjectEnum, IGWEnumObjects>(IID_IGWEnumObjects)};
        return map;
    }
    HRESULT STDMETHODCALLTYPE Next(IUnknown** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        if (HRESULT hr = ut::sdk::CheckHostFault("IGWEnumObjects::Next"); FAILED(hr))
            return hr;
        if (next_ == objects_.size())
            return S_FALSE;
        *object = ut::ComPtr<IUnknown>(objects_[next_++]).Detach();
        return S_OK;
    }

private:
    std::vector<ut::ComPtr<IUnknown>> objects_;
    std::size_t next_ = 0;
};

} // namespace

HRESULT HandOutObjects(std::vector<ut::ComPtr<IUnknown>> objects, IGWEnumObjects** enumeration) {
    if (!enumeration)
        return E_POINTER;
    *enumeration = Make<ObjectEnum>(std::move(objects)).Detach();
    return *enumeration ? S_OK : E_OUTOFMEMORY;
}

} // namespace ut::host
