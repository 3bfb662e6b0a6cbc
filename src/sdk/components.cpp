// GWGetSetValueProxy and GWGetParamDict: the application's set-value proxy and parameter
// dictionary, found among its services.
#include <ut/sdk/components.h>
#include <ut/sdk/objects.h>

HRESULT GWGetSetValueProxy(IGWComponentHierarchy* hierarchy, REFIID iid, void** proxy) {
    if (!proxy)
        return E_POINTER;
    *proxy = nullptr;
    if (!hierarchy)
        return E_POINTER;
    // One proxy serves every hierarchy: the hierarchy is named again with each value it sets.
    ut::ComPtr<IUnknown> found;
    if (HRESULT hr = GWQueryGenericObject(CLSID_GWSetValueProxy, found.PutVoid()); FAILED(hr))
        return hr;
    return found->QueryInterface(iid, proxy);
}

HRESULT GWGetParamDict(REFIID iid, void** dict, IUnknown*) {
    if (!dict)
        return E_POINTER;
    *dict = nullptr;
    ut::ComPtr<IUnknown> found;
    if (HRESULT hr = GWQueryGenericObject(CLSID_GWParamDict, found.PutVoid()); FAILED(hr))
        return hr;
    return found->QueryInterface(iid, dict);
}
