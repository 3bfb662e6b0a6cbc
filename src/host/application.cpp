// The reference host's plug-in registry and its items.
#include "application.h"

#include <new>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/strings.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

namespace ut::host {
namespace {

class PluginItem final : public ut::sdk::ComObject<IKXPluginItem> {
public:
    PluginItem(const GUID& kind, std::wstring name) : kind_(kind), name_(std::move(name)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {sdk::Entry<PluginItem, IKXPluginItem>(IID_IKXPluginItem)};
        return map;
    }
    HRESULT STDMETHODCALLTYPE GetName(wchar_t** name) override { return CopyToTaskMemory(name_, name); }
    HRESULT STDMETHODCALLTYPE GetKind(GUID* kind) override {
        if (!kind)
            return E_POINTER;
        *kind = kind_;
        return S_OK;
    }

private:
    GUID kind_;
    std::wstring name_;
};

bool SameName(const std::wstring& a, const wchar_t* b) {
    return ut::platform::CompareWideNoCase(a.c_str(), b) == 0;
}

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> PluginRegistry::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        sdk::Entry<PluginRegistry, IKXPluginRegistry>(IID_IKXPluginRegistry)};
    return map;
}

const PluginRegistry::Item* PluginRegistry::Find(REFGUID kind, const wchar_t* name) const {
    for (const Item& item : items_)
        if (item.kind == kind && SameName(item.name, name))
            return &item;
    return nullptr;
}

HRESULT PluginRegistry::GetItem(ULONG reserved, REFGUID kind, const wchar_t* name, IKXPluginItem** item) {
    if (!name || !item)
        return E_POINTER;
    *item = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IKXPluginRegistry::GetItem"); FAILED(hr))
        return hr;
    if (reserved)
        return E_INVALIDARG;
    const Item* found = Find(kind, name);
    if (!found)
        return S_FALSE;
    return ExportBoundary([&] {
        *item = new PluginItem(found->kind, found->name);
        return S_OK;
    });
}

HRESULT PluginRegistry::AddItem(REFGUID kind, const wchar_t* name) {
    if (!name)
        return E_POINTER;
    if (Find(kind, name))
        return S_FALSE;
    return ExportBoundary([&] {
        items_.push_back({kind, name});
        return S_OK;
    });
}

} // namespace ut::host
