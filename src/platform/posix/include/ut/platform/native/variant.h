// POSIX home: VARIANT, BSTR and SAFEARRAY with the Windows layout and semantics, for the subset
// of types the library uses (numbers, booleans, strings, interfaces, arrays, references).
#pragma once

#include <ut/platform/native/com.h>

using VARTYPE = USHORT;
using VARIANT_BOOL = SHORT;
using BSTR = OLECHAR*;
using DATE = double;
using FLOAT = float;
using DOUBLE = double;
using CHAR = char;

inline constexpr VARIANT_BOOL VARIANT_TRUE = -1;
inline constexpr VARIANT_BOOL VARIANT_FALSE = 0;

enum VARENUM : VARTYPE {
    VT_EMPTY = 0,
    VT_NULL = 1,
    VT_I2 = 2,
    VT_I4 = 3,
    VT_R4 = 4,
    VT_R8 = 5,
    VT_CY = 6,
    VT_DATE = 7,
    VT_BSTR = 8,
    VT_DISPATCH = 9,
    VT_ERROR = 10,
    VT_BOOL = 11,
    VT_VARIANT = 12,
    VT_UNKNOWN = 13,
    VT_DECIMAL = 14,
    VT_I1 = 16,
    VT_UI1 = 17,
    VT_UI2 = 18,
    VT_UI4 = 19,
    VT_I8 = 20,
    VT_UI8 = 21,
    VT_INT = 22,
    VT_UINT = 23,
    VT_VOID = 24,
    VT_HRESULT = 25,
    VT_LPSTR = 30,
    VT_LPWSTR = 31,
    VT_CLSID = 72,
    VT_ARRAY = 0x2000,
    VT_BYREF = 0x4000,
    VT_TYPEMASK = 0xFFF,
};

struct SAFEARRAYBOUND {
    ULONG cElements;
    LONG lLbound;
};

struct SAFEARRAY {
    USHORT cDims;
    USHORT fFeatures;
    ULONG cbElements;
    ULONG cLocks;
    void* pvData;
    SAFEARRAYBOUND rgsabound[1];
};

inline constexpr USHORT FADF_AUTO = 0x1;
inline constexpr USHORT FADF_STATIC = 0x2;
inline constexpr USHORT FADF_EMBEDDED = 0x4;
inline constexpr USHORT FADF_FIXEDSIZE = 0x10;
inline constexpr USHORT FADF_HAVEVARTYPE = 0x80;
inline constexpr USHORT FADF_BSTR = 0x100;
inline constexpr USHORT FADF_UNKNOWN = 0x200;
inline constexpr USHORT FADF_VARIANT = 0x800;

// Named outside the union: anonymous structs inside an anonymous union are an extension.
struct tagBRECORD {
    void* pvRecord;
    void* pRecInfo;
};

struct VARIANT {
    VARTYPE vt;
    WORD wReserved1;
    WORD wReserved2;
    WORD wReserved3;
    union {
        LONGLONG llVal;
        LONG lVal;
        BYTE bVal;
        SHORT iVal;
        FLOAT fltVal;
        DOUBLE dblVal;
        VARIANT_BOOL boolVal;
        SCODE scode;
        DATE date;
        BSTR bstrVal;
        IUnknown* punkVal;
        SAFEARRAY* parray;
        CHAR cVal;
        USHORT uiVal;
        ULONG ulVal;
        ULONGLONG ullVal;
        INT intVal;
        UINT uintVal;
        BYTE* pbVal;
        LONG* plVal;
        DOUBLE* pdblVal;
        BSTR* pbstrVal;
        VARIANT* pvarVal;
        void* byref;
        tagBRECORD brecVal;
    };
};
using VARIANTARG = VARIANT;

extern "C" {
UT_PLATFORM_API BSTR SysAllocString(const OLECHAR* text);
// `text` may be null: the string then holds `length` zero characters.
UT_PLATFORM_API BSTR SysAllocStringLen(const OLECHAR* text, UINT length);
UT_PLATFORM_API BSTR SysAllocStringByteLen(const char* bytes, UINT length);
UT_PLATFORM_API void SysFreeString(BSTR text);
UT_PLATFORM_API UINT SysStringLen(BSTR text);
UT_PLATFORM_API UINT SysStringByteLen(BSTR text);

UT_PLATFORM_API void VariantInit(VARIANT* value);
UT_PLATFORM_API HRESULT VariantClear(VARIANT* value);
UT_PLATFORM_API HRESULT VariantCopy(VARIANT* target, const VARIANT* source);

UT_PLATFORM_API SAFEARRAY* SafeArrayCreate(VARTYPE type, UINT dims, SAFEARRAYBOUND* bounds);
UT_PLATFORM_API SAFEARRAY* SafeArrayCreateVector(VARTYPE type, LONG lowerBound, ULONG elements);
UT_PLATFORM_API HRESULT SafeArrayDestroy(SAFEARRAY* array);
UT_PLATFORM_API HRESULT SafeArrayCopy(SAFEARRAY* source, SAFEARRAY** copy);
UT_PLATFORM_API UINT SafeArrayGetDim(SAFEARRAY* array);
UT_PLATFORM_API UINT SafeArrayGetElemsize(SAFEARRAY* array);
UT_PLATFORM_API HRESULT SafeArrayGetVartype(SAFEARRAY* array, VARTYPE* type);
UT_PLATFORM_API HRESULT SafeArrayGetLBound(SAFEARRAY* array, UINT dim, LONG* bound);
UT_PLATFORM_API HRESULT SafeArrayGetUBound(SAFEARRAY* array, UINT dim, LONG* bound);
UT_PLATFORM_API HRESULT SafeArrayAccessData(SAFEARRAY* array, void** data);
UT_PLATFORM_API HRESULT SafeArrayUnaccessData(SAFEARRAY* array);
UT_PLATFORM_API HRESULT SafeArrayLock(SAFEARRAY* array);
UT_PLATFORM_API HRESULT SafeArrayUnlock(SAFEARRAY* array);
}
