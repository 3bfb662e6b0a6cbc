// BSTR, VARIANT and SAFEARRAY for POSIX, laid out as on Windows: a BSTR carries its byte length in
// the four bytes before its first character; a SAFEARRAY keeps its element type just before the
// descriptor and stores its bounds right-most dimension first.
#include <cstdlib>
#include <cstring>
#include <new>

#include <ut/platform/variant.h>

namespace {

constexpr HRESULT kArrayLocked = static_cast<HRESULT>(0x8002000D); // DISP_E_ARRAYISLOCKED

// The block keeps the text aligned for any use; the byte length fills the header's last four bytes.
struct BstrHeader {
    alignas(std::max_align_t) char padding[sizeof(std::max_align_t) - sizeof(std::uint32_t)];
    std::uint32_t bytes;
};
static_assert(sizeof(BstrHeader) == sizeof(std::max_align_t));

BstrHeader* HeaderOf(BSTR text) {
    return reinterpret_cast<BstrHeader*>(reinterpret_cast<char*>(text) - sizeof(BstrHeader));
}

BSTR AllocateBstr(std::size_t bytes) {
    if (bytes > 0x7FFFFFF0)
        return nullptr;
    auto* block = static_cast<char*>(std::malloc(sizeof(BstrHeader) + bytes + sizeof(OLECHAR)));
    if (!block)
        return nullptr;
    reinterpret_cast<BstrHeader*>(block)->bytes = static_cast<std::uint32_t>(bytes);
    char* text = block + sizeof(BstrHeader);
    std::memset(text + bytes, 0, sizeof(OLECHAR));
    return reinterpret_cast<BSTR>(text);
}

ULONG ElementSize(VARTYPE type) {
    if (ULONG size = ut::NumericSize(type))
        return size;
    switch (type) {
    case VT_BSTR:
    case VT_UNKNOWN:
    case VT_DISPATCH:
        return sizeof(void*);
    case VT_VARIANT:
        return sizeof(VARIANT);
    default:
        return 0;
    }
}

USHORT FeaturesOf(VARTYPE type) {
    switch (type) {
    case VT_BSTR:
        return FADF_HAVEVARTYPE | FADF_BSTR;
    case VT_UNKNOWN:
    case VT_DISPATCH:
        return FADF_HAVEVARTYPE | FADF_UNKNOWN;
    case VT_VARIANT:
        return FADF_HAVEVARTYPE | FADF_VARIANT;
    default:
        return FADF_HAVEVARTYPE;
    }
}

// The element type sits in a header of its own just before the descriptor.
struct ArrayHeader {
    alignas(std::max_align_t) VARTYPE type;
};

ArrayHeader* HeaderOf(SAFEARRAY* array) {
    return reinterpret_cast<ArrayHeader*>(reinterpret_cast<char*>(array) - sizeof(ArrayHeader));
}

ULONGLONG ElementCount(const SAFEARRAY* array) {
    ULONGLONG count = 1;
    for (USHORT d = 0; d < array->cDims; ++d)
        count *= array->rgsabound[d].cElements;
    return count;
}

void ReleaseElements(SAFEARRAY* array) {
    ULONGLONG count = ElementCount(array);
    if (array->fFeatures & FADF_BSTR) {
        for (ULONGLONG i = 0; i < count; ++i)
            SysFreeString(static_cast<BSTR*>(array->pvData)[i]);
    } else if (array->fFeatures & FADF_UNKNOWN) {
        for (ULONGLONG i = 0; i < count; ++i)
            if (IUnknown* element = static_cast<IUnknown**>(array->pvData)[i])
                element->Release();
    } else if (array->fFeatures & FADF_VARIANT) {
        for (ULONGLONG i = 0; i < count; ++i)
            VariantClear(static_cast<VARIANT*>(array->pvData) + i);
    }
}

// Copies elements from `source` into the zeroed data of `target`, taking references.
HRESULT CopyElements(SAFEARRAY* source, SAFEARRAY* target) {
    ULONGLONG count = ElementCount(source);
    if (source->fFeatures & FADF_BSTR) {
        for (ULONGLONG i = 0; i < count; ++i) {
            BSTR from = static_cast<BSTR*>(source->pvData)[i];
            if (!from)
                continue;
            BSTR copy = SysAllocStringByteLen(reinterpret_cast<const char*>(from), SysStringByteLen(from));
            if (!copy)
                return E_OUTOFMEMORY;
            static_cast<BSTR*>(target->pvData)[i] = copy;
        }
        return S_OK;
    }
    if (source->fFeatures & FADF_VARIANT) {
        for (ULONGLONG i = 0; i < count; ++i) {
            HRESULT hr = VariantCopy(static_cast<VARIANT*>(target->pvData) + i,
                                     static_cast<VARIANT*>(source->pvData) + i);
            if (FAILED(hr))
                return hr;
        }
        return S_OK;
    }
    std::memcpy(target->pvData, source->pvData, count * source->cbElements);
    if (source->fFeatures & FADF_UNKNOWN) {
        for (ULONGLONG i = 0; i < count; ++i)
            if (IUnknown* element = static_cast<IUnknown**>(target->pvData)[i])
                element->AddRef();
    }
    return S_OK;
}

} // namespace

extern "C" {

BSTR SysAllocString(const OLECHAR* text) {
    if (!text)
        return nullptr;
    std::size_t length = 0;
    while (text[length])
        ++length;
    return SysAllocStringLen(text, static_cast<UINT>(length));
}

BSTR SysAllocStringLen(const OLECHAR* text, UINT length) {
    BSTR result = AllocateBstr(static_cast<std::size_t>(length) * sizeof(OLECHAR));
    if (!result)
        return nullptr;
    if (text)
        std::memcpy(result, text, static_cast<std::size_t>(length) * sizeof(OLECHAR));
    else
        std::memset(result, 0, static_cast<std::size_t>(length) * sizeof(OLECHAR));
    return result;
}

BSTR SysAllocStringByteLen(const char* bytes, UINT length) {
    BSTR result = AllocateBstr(length);
    if (!result)
        return nullptr;
    if (bytes)
        std::memcpy(result, bytes, length);
    else
        std::memset(result, 0, length);
    return result;
}

void SysFreeString(BSTR text) {
    if (text)
        std::free(HeaderOf(text));
}

UINT SysStringLen(BSTR text) {
    return text ? HeaderOf(text)->bytes / sizeof(OLECHAR) : 0;
}

UINT SysStringByteLen(BSTR text) {
    return text ? HeaderOf(text)->bytes : 0;
}

void VariantInit(VARIANT* value) {
    if (!value)
        return;
    std::memset(value, 0, sizeof *value);
    value->vt = VT_EMPTY;
}

HRESULT VariantClear(VARIANT* value) {
    if (!value)
        return E_INVALIDARG;
    VARTYPE type = value->vt;
    if (type & VT_BYREF) {
        value->vt = VT_EMPTY;
        return S_OK;
    }
    if (type & VT_ARRAY) {
        HRESULT hr = SafeArrayDestroy(value->parray);
        if (FAILED(hr))
            return hr;
    } else if (type == VT_BSTR) {
        SysFreeString(value->bstrVal);
    } else if (type == VT_UNKNOWN || type == VT_DISPATCH) {
        if (value->punkVal)
            value->punkVal->Release();
    } else if (type > VT_VOID && type != VT_HRESULT && type != VT_LPSTR && type != VT_LPWSTR &&
               type != VT_CLSID) {
        return DISP_E_BADVARTYPE;
    }
    value->vt = VT_EMPTY;
    value->llVal = 0;
    return S_OK;
}

HRESULT VariantCopy(VARIANT* target, const VARIANT* source) {
    if (!target || !source)
        return E_INVALIDARG;
    if (target == source)
        return S_OK;
    HRESULT hr = VariantClear(target);
    if (FAILED(hr))
        return hr;
    VARIANT copy = *source;
    if (!(source->vt & VT_BYREF)) {
        if (source->vt & VT_ARRAY) {
            hr = SafeArrayCopy(source->parray, &copy.parray);
        } else if (source->vt == VT_BSTR && source->bstrVal) {
            copy.bstrVal = SysAllocStringByteLen(reinterpret_cast<const char*>(source->bstrVal),
                                                 SysStringByteLen(source->bstrVal));
            hr = copy.bstrVal ? S_OK : E_OUTOFMEMORY;
        } else if ((source->vt == VT_UNKNOWN || source->vt == VT_DISPATCH) && source->punkVal) {
            source->punkVal->AddRef();
        }
    }
    if (FAILED(hr))
        return hr;
    *target = copy;
    return S_OK;
}

SAFEARRAY* SafeArrayCreate(VARTYPE type, UINT dims, SAFEARRAYBOUND* bounds) {
    ULONG size = ElementSize(type);
    if (size == 0 || dims == 0 || dims > 0xFFFF || !bounds)
        return nullptr;
    ULONGLONG count = 1;
    for (UINT d = 0; d < dims; ++d) {
        count *= bounds[d].cElements;
        if (count > 0x7FFFFFFFull / size)
            return nullptr;
    }
    std::size_t descriptor = sizeof(SAFEARRAY) + (dims - 1) * sizeof(SAFEARRAYBOUND);
    auto* block = static_cast<char*>(std::calloc(1, sizeof(ArrayHeader) + descriptor));
    if (!block)
        return nullptr;
    reinterpret_cast<ArrayHeader*>(block)->type = type;
    auto* array = reinterpret_cast<SAFEARRAY*>(block + sizeof(ArrayHeader));
    array->cDims = static_cast<USHORT>(dims);
    array->fFeatures = FeaturesOf(type);
    array->cbElements = size;
    for (UINT d = 0; d < dims; ++d)
        array->rgsabound[d] = bounds[dims - 1 - d];
    array->pvData = std::calloc(count ? count : 1, size);
    if (!array->pvData) {
        std::free(block);
        return nullptr;
    }
    return array;
}

SAFEARRAY* SafeArrayCreateVector(VARTYPE type, LONG lowerBound, ULONG elements) {
    SAFEARRAYBOUND bound{elements, lowerBound};
    return SafeArrayCreate(type, 1, &bound);
}

HRESULT SafeArrayDestroy(SAFEARRAY* array) {
    if (!array)
        return S_OK;
    if (array->cLocks > 0)
        return kArrayLocked;
    ReleaseElements(array);
    std::free(array->pvData);
    std::free(HeaderOf(array));
    return S_OK;
}

HRESULT SafeArrayCopy(SAFEARRAY* source, SAFEARRAY** copy) {
    if (!copy)
        return E_INVALIDARG;
    *copy = nullptr;
    if (!source)
        return S_OK;
    SAFEARRAYBOUND bounds[64];
    if (source->cDims > 64)
        return E_INVALIDARG;
    for (USHORT d = 0; d < source->cDims; ++d)
        bounds[d] = source->rgsabound[source->cDims - 1 - d];
    SAFEARRAY* target = SafeArrayCreate(HeaderOf(source)->type, source->cDims, bounds);
    if (!target)
        return E_OUTOFMEMORY;
    HRESULT hr = CopyElements(source, target);
    if (FAILED(hr)) {
        SafeArrayDestroy(target);
        return hr;
    }
    *copy = target;
    return S_OK;
}

UINT SafeArrayGetDim(SAFEARRAY* array) {
    return array ? array->cDims : 0;
}

UINT SafeArrayGetElemsize(SAFEARRAY* array) {
    return array ? array->cbElements : 0;
}

HRESULT SafeArrayGetVartype(SAFEARRAY* array, VARTYPE* type) {
    if (!array || !type)
        return E_INVALIDARG;
    *type = HeaderOf(array)->type;
    return S_OK;
}

HRESULT SafeArrayGetLBound(SAFEARRAY* array, UINT dim, LONG* bound) {
    if (!array || !bound)
        return E_INVALIDARG;
    if (dim < 1 || dim > array->cDims)
        return DISP_E_BADINDEX;
    *bound = array->rgsabound[array->cDims - dim].lLbound;
    return S_OK;
}

HRESULT SafeArrayGetUBound(SAFEARRAY* array, UINT dim, LONG* bound) {
    if (!array || !bound)
        return E_INVALIDARG;
    if (dim < 1 || dim > array->cDims)
        return DISP_E_BADINDEX;
    const SAFEARRAYBOUND& b = array->rgsabound[array->cDims - dim];
    *bound = static_cast<LONG>(static_cast<LONGLONG>(b.lLbound) + b.cElements - 1);
    return S_OK;
}

HRESULT SafeArrayLock(SAFEARRAY* array) {
    if (!array)
        return E_INVALIDARG;
    ++array->cLocks;
    return S_OK;
}

HRESULT SafeArrayUnlock(SAFEARRAY* array) {
    if (!array)
        return E_INVALIDARG;
    if (array->cLocks == 0)
        return E_UNEXPECTED;
    --array->cLocks;
    return S_OK;
}

HRESULT SafeArrayAccessData(SAFEARRAY* array, void** data) {
    if (!array || !data)
        return E_INVALIDARG;
    SafeArrayLock(array);
    *data = array->pvData;
    return S_OK;
}

HRESULT SafeArrayUnaccessData(SAFEARRAY* array) {
    return SafeArrayUnlock(array);
}

} // extern "C"
