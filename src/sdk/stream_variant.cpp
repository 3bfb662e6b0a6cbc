// VARIANT and SAFEARRAY on the stream (the layout is described in stream_helper.h).
#include <string>

#include <ut/sdk/stream_helper.h>
#include <ut/sdk/variant.h>

namespace {

using ut::sdk::Rewind;

constexpr int kMaxNesting = 8;
constexpr USHORT kMaxDimensions = 64;

// Bytes of the value of a plain numeric type, 0 for the types without a value, -1 for types
// that are not plain numbers.
int PlainSize(VARTYPE type) {
    if (type == VT_EMPTY || type == VT_NULL)
        return 0;
    ULONG size = ut::NumericSize(type);
    return size ? static_cast<int>(size) : -1;
}

// The fewest stream bytes one element of an array of `type` takes, or 0 when arrays of that
// type are not stored.
ULONG MinElementBytes(VARTYPE type) {
    if (type == VT_BSTR)
        return sizeof(ULONG);
    if (type == VT_VARIANT)
        return sizeof(VARTYPE);
    int size = PlainSize(type);
    return size > 0 ? static_cast<ULONG>(size) : 0;
}

// Holds SafeArrayAccessData for a scope.
class ArrayData {
public:
    explicit ArrayData(SAFEARRAY* array) : array_(array) {
        if (FAILED(SafeArrayAccessData(array_, &data_)))
            data_ = nullptr;
    }
    ~ArrayData() {
        if (data_)
            SafeArrayUnaccessData(array_);
    }
    ArrayData(const ArrayData&) = delete;
    ArrayData& operator=(const ArrayData&) = delete;
    BYTE* Get() const { return static_cast<BYTE*>(data_); }

private:
    SAFEARRAY* array_;
    void* data_ = nullptr;
};

HRESULT ArrayType(SAFEARRAY* array, VARTYPE& type) {
    if (SUCCEEDED(SafeArrayGetVartype(array, &type)))
        return S_OK;
    if (array->fFeatures & FADF_BSTR)
        type = VT_BSTR;
    else if (array->fFeatures & FADF_VARIANT)
        type = VT_VARIANT;
    else
        return DISP_E_BADVARTYPE;
    return S_OK;
}

} // namespace

HRESULT CGWStreamHelper::PutVARIANT(const VARIANT& value) {
    Rewind rewind(Buffer());
    return rewind(PutVariantAt(value, 0));
}

HRESULT CGWStreamHelper::GetVARIANT(VARIANT* value) {
    if (!value)
        return E_POINTER;
    Rewind rewind(Buffer());
    return rewind(GetVariantAt(value, 0));
}

HRESULT CGWStreamHelper::PutSAFEARRAY(SAFEARRAY* array) {
    VARTYPE type = VT_EMPTY;
    if (array) {
        if (HRESULT hr = ArrayType(array, type); FAILED(hr))
            return hr;
    }
    Rewind rewind(Buffer());
    HRESULT hr = Buffer().WriteValue(type);
    if (SUCCEEDED(hr))
        hr = PutArrayBody(array, type, 0);
    return rewind(hr);
}

HRESULT CGWStreamHelper::GetSAFEARRAY(SAFEARRAY** array) {
    if (!array)
        return E_POINTER;
    *array = nullptr;
    Rewind rewind(Buffer());
    VARTYPE type = VT_EMPTY;
    HRESULT hr = Buffer().ReadValue(type);
    if (SUCCEEDED(hr))
        hr = GetArrayBody(array, type, 0);
    return rewind(hr);
}

HRESULT CGWStreamHelper::PutVariantAt(const VARIANT& value, int depth) {
    VARTYPE type = value.vt;
    if (depth > kMaxNesting)
        return E_INVALIDARG;
    if (type & VT_ARRAY) {
        VARTYPE element = type & VT_TYPEMASK;
        if ((type & ~(VT_ARRAY | VT_TYPEMASK)) || !MinElementBytes(element))
            return DISP_E_BADVARTYPE;
        HRESULT hr = Buffer().WriteValue(type);
        return SUCCEEDED(hr) ? PutArrayBody(value.parray, element, depth) : hr;
    }
    if (type == GW_VT_GUID) {
        if (depth > 0)
            return DISP_E_BADVARTYPE;
        if (!value.byref)
            return E_INVALIDARG;
        HRESULT hr = Buffer().WriteValue(type);
        return SUCCEEDED(hr) ? PutGUID(*static_cast<const GUID*>(value.byref)) : hr;
    }
    if (type == VT_BSTR) {
        HRESULT hr = Buffer().WriteValue(type);
        return SUCCEEDED(hr) ? PutBSTR(value.bstrVal) : hr;
    }
    int size = PlainSize(type);
    if (size < 0)
        return DISP_E_BADVARTYPE;
    HRESULT hr = Buffer().WriteValue(type);
    return SUCCEEDED(hr) ? Buffer().Write(&value.llVal, static_cast<ULONG>(size)) : hr;
}

HRESULT CGWStreamHelper::GetVariantAt(VARIANT* value, int depth) {
    if (depth > kMaxNesting)
        return E_FAIL;
    VARTYPE type = VT_EMPTY;
    if (HRESULT hr = Buffer().ReadValue(type); FAILED(hr))
        return hr;
    if (type & VT_ARRAY) {
        VARTYPE element = type & VT_TYPEMASK;
        if (type & ~(VT_ARRAY | VT_TYPEMASK))
            return DISP_E_BADVARTYPE;
        SAFEARRAY* array = nullptr;
        if (HRESULT hr = GetArrayBody(&array, element, depth); FAILED(hr))
            return hr;
        value->vt = type;
        value->parray = array;
        return S_OK;
    }
    if (type == GW_VT_GUID) {
        GUID guid{};
        if (depth > 0)
            return DISP_E_BADVARTYPE;
        HRESULT hr = GetGUID(guid);
        return SUCCEEDED(hr) ? GWVariantSetGUID(value, guid) : hr;
    }
    if (type == VT_BSTR) {
        BSTR text = nullptr;
        if (HRESULT hr = GetBSTR(&text); FAILED(hr))
            return hr;
        value->vt = VT_BSTR;
        value->bstrVal = text;
        return S_OK;
    }
    int size = PlainSize(type);
    if (size < 0)
        return DISP_E_BADVARTYPE;
    LONGLONG bits = 0;
    if (HRESULT hr = Buffer().Read(&bits, static_cast<ULONG>(size)); FAILED(hr))
        return hr;
    value->vt = type;
    value->llVal = bits;
    return S_OK;
}

HRESULT CGWStreamHelper::PutArrayBody(SAFEARRAY* array, VARTYPE type, int depth) {
    if (!array)
        return Buffer().WriteValue(USHORT{0});
    ULONG elementBytes = MinElementBytes(type);
    UINT dimensions = SafeArrayGetDim(array);
    if (!elementBytes ||
        (type != VT_BSTR && type != VT_VARIANT && SafeArrayGetElemsize(array) != elementBytes))
        return DISP_E_BADVARTYPE;
    if (dimensions == 0 || dimensions > kMaxDimensions)
        return E_INVALIDARG;
    if (HRESULT hr = Buffer().WriteValue(static_cast<USHORT>(dimensions)); FAILED(hr))
        return hr;
    ULONGLONG count = 1;
    for (UINT d = 1; d <= dimensions; ++d) {
        LONG lower = 0, upper = 0;
        SafeArrayGetLBound(array, d, &lower);
        SafeArrayGetUBound(array, d, &upper);
        ULONG elements = static_cast<ULONG>(static_cast<LONGLONG>(upper) - lower + 1);
        count *= elements;
        if (HRESULT hr = Buffer().WriteValue(elements); FAILED(hr))
            return hr;
        if (HRESULT hr = Buffer().WriteValue(lower); FAILED(hr))
            return hr;
    }
    ArrayData data(array);
    if (!data.Get())
        return E_UNEXPECTED;
    if (type == VT_BSTR || type == VT_VARIANT) {
        for (ULONGLONG i = 0; i < count; ++i) {
            HRESULT hr = type == VT_BSTR ? PutBSTR(reinterpret_cast<BSTR*>(data.Get())[i])
                                         : PutVariantAt(reinterpret_cast<VARIANT*>(data.Get())[i], depth + 1);
            if (FAILED(hr))
                return hr;
        }
        return S_OK;
    }
    if (count * elementBytes > ut::sdk::StreamBuffer::kMaxPosition)
        return STG_E_MEDIUMFULL;
    return Buffer().Write(data.Get(), static_cast<ULONG>(count * elementBytes));
}

HRESULT CGWStreamHelper::GetArrayBody(SAFEARRAY** array, VARTYPE type, int depth) {
    USHORT dimensions = 0;
    if (HRESULT hr = Buffer().ReadValue(dimensions); FAILED(hr))
        return hr;
    if (dimensions == 0)
        return S_OK;
    ULONG elementBytes = MinElementBytes(type);
    if (!elementBytes)
        return DISP_E_BADVARTYPE;
    if (dimensions > kMaxDimensions)
        return E_FAIL;
    SAFEARRAYBOUND bounds[kMaxDimensions];
    ULONGLONG count = 1;
    for (USHORT d = 0; d < dimensions; ++d) {
        if (HRESULT hr = Buffer().ReadValue(bounds[d].cElements); FAILED(hr))
            return hr;
        if (HRESULT hr = Buffer().ReadValue(bounds[d].lLbound); FAILED(hr))
            return hr;
        count *= bounds[d].cElements;
        if (count > ut::sdk::StreamBuffer::kMaxPosition)
            return E_FAIL;
    }
    // The stream must hold the elements before memory is taken for them.
    if (HRESULT hr = Buffer().EnsureReadable(count * elementBytes); FAILED(hr))
        return hr;
    ut::UniqueSafeArray made(SafeArrayCreate(type, dimensions, bounds));
    if (!made)
        return E_OUTOFMEMORY;
    ArrayData data(made.get());
    if (!data.Get())
        return E_UNEXPECTED;
    for (ULONGLONG i = 0; i < count && (type == VT_BSTR || type == VT_VARIANT); ++i) {
        HRESULT hr = type == VT_BSTR ? GetBSTR(reinterpret_cast<BSTR*>(data.Get()) + i)
                                     : GetVariantAt(reinterpret_cast<VARIANT*>(data.Get()) + i, depth + 1);
        if (FAILED(hr))
            return hr;
    }
    if (type != VT_BSTR && type != VT_VARIANT) {
        if (HRESULT hr = Buffer().Read(data.Get(), static_cast<ULONG>(count * elementBytes)); FAILED(hr))
            return hr;
    }
    *array = made.release();
    return S_OK;
}
