// Access to the host's families manager, and the registration calls that go through it.
#include <ut/sdk/families.h>
#include <ut/sdk/objects.h>

namespace {

// Runs `call` on the families manager, or answers why there is none.
template <class Call>
HRESULT WithManager(Call call) {
    ut::ComPtr<IGWFamiliesManager> manager;
    if (HRESULT hr = GWGetFamiliesManager(manager.Put()); FAILED(hr))
        return hr;
    return call(*manager);
}

} // namespace

HRESULT GWGetFamiliesManager(IGWFamiliesManager** manager) {
    if (!manager)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_GWFamiliesManager, IID_IGWFamiliesManager,
                                reinterpret_cast<void**>(manager));
}

HRESULT GWRegisterFamily(REFGUID family, REFCLSID familyClass, REFGUID parent, const wchar_t* kind,
                         const wchar_t* path, HINSTANCE module, REFCLSID editor, REFCLSID inspector) {
    return WithManager([&](IGWFamiliesManager& manager) {
        return manager.RegisterFamily(family, familyClass, parent, kind, path, module, editor, inspector);
    });
}

HRESULT GWUnregisterFamily(REFGUID family, HINSTANCE module) {
    return WithManager([&](IGWFamiliesManager& manager) { return manager.UnregisterFamily(family, module); });
}

HRESULT GWRegisterObjectFamilies(REFCLSID clsid, unsigned int count, const GUID* families, bool flag,
                                 const wchar_t* name, HINSTANCE module) {
    return WithManager([&](IGWFamiliesManager& manager) {
        return manager.RegisterMembers(clsid, count, families, flag ? TRUE : FALSE, name, module);
    });
}

HRESULT GWUnregisterObjectFamilies(REFCLSID clsid, unsigned int count, const GUID* families,
                                   HINSTANCE module) {
    return WithManager([&](IGWFamiliesManager& manager) {
        return manager.UnregisterMembers(clsid, count, families, module);
    });
}
