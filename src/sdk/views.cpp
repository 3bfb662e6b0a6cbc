// Access to the host's view manager.
#include <ut/sdk/objects.h>
#include <ut/sdk/views.h>

HRESULT GWGetViewMgr(IGWViewManager** manager) {
    if (!manager)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_GWViewManager, IID_IGWViewManager, reinterpret_cast<void**>(manager));
}

HRESULT GWFindViewNameFromCLSID(REFCLSID clsid, wchar_t* name, int capacity) {
    if (capacity < 0)
        return E_INVALIDARG;
    ut::ComPtr<IGWViewManager> manager;
    if (HRESULT hr = GWGetViewMgr(manager.Put()); FAILED(hr))
        return hr;
    return manager->GetViewName(clsid, name, static_cast<ULONG>(capacity));
}
