// VARIANT helpers of the SDK.
#include <ut/sdk/variant.h>

HRESULT GWVariantClear(VARIANT* value) {
    if (!value)
        return E_INVALIDARG;
    if (value->vt != GW_VT_GUID)
        return VariantClear(value);
    CoTaskMemFree(value->byref);
    value->byref = nullptr;
    value->vt = VT_EMPTY;
    return S_OK;
}

HRESULT GWVariantSetGUID(VARIANT* value, REFGUID guid) {
    if (!value)
        return E_INVALIDARG;
    auto* copy = static_cast<GUID*>(CoTaskMemAlloc(sizeof(GUID)));
    if (!copy)
        return E_OUTOFMEMORY;
    *copy = guid;
    value->vt = GW_VT_GUID;
    value->byref = copy;
    return S_OK;
}
