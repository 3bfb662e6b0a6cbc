// The reference host's families manager: object families and their members, kept in the registry
// as ut/sdk/families.h describes.
#pragma once

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/families.h>

namespace ut::host {

class FamiliesManager final : public ut::sdk::ComObject<IGWFamiliesManager> {
public:
    explicit FamiliesManager(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE RegisterFamily(REFGUID family, REFCLSID familyClass, REFGUID parent,
                                             const wchar_t* kind, const wchar_t* path, HINSTANCE module,
                                             REFCLSID editor, REFCLSID inspector) override;
    HRESULT STDMETHODCALLTYPE UnregisterFamily(REFGUID family, HINSTANCE module) override;
    HRESULT STDMETHODCALLTYPE RegisterMembers(REFCLSID clsid, ULONG count, const GUID* families, BOOL flag,
                                              const wchar_t* name, HINSTANCE module) override;
    HRESULT STDMETHODCALLTYPE UnregisterMembers(REFCLSID clsid, ULONG count, const GUID* families,
                                                HINSTANCE module) override;
    HRESULT STDMETHODCALLTYPE EnumMembers(REFGUID family, IGWEnumGUID** members) override;
    HRESULT STDMETHODCALLTYPE IsMember(REFCLSID clsid, REFGUID family) override;
    HRESULT STDMETHODCALLTYPE EnumFamilies(IGWEnumGUID** families) override;
    HRESULT STDMETHODCALLTYPE GetFamilyName(REFGUID family, LPOLESTR* name) override;
    HRESULT STDMETHODCALLTYPE GetClassFamilies(REFCLSID clsid, ULONG capacity, GUID* families,
                                               ULONG* count) override;
};

} // namespace ut::host
