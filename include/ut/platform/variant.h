// VARIANT, BSTR and SAFEARRAY on both homes, and owners that release them on every path.
#pragma once

#include <memory>

#include <ut/platform/com.h>
#include <ut/platform/native/variant.h>

namespace ut {

// Bytes of a value of a fixed-size numeric type (VT_I1 to VT_DATE, booleans and error codes
// included), 0 for every other type.
constexpr ULONG NumericSize(VARTYPE type) {
    switch (type) {
    case VT_I1:
    case VT_UI1:
        return 1;
    case VT_I2:
    case VT_UI2:
    case VT_BOOL:
        return 2;
    case VT_I4:
    case VT_UI4:
    case VT_R4:
    case VT_INT:
    case VT_UINT:
    case VT_ERROR:
        return 4;
    case VT_I8:
    case VT_UI8:
    case VT_R8:
    case VT_CY:
    case VT_DATE:
        return 8;
    default:
        return 0;
    }
}

struct BstrDeleter {
    void operator()(OLECHAR* text) const noexcept { SysFreeString(text); }
};
// Owns a BSTR.
using UniqueBstr = std::unique_ptr<OLECHAR, BstrDeleter>;

struct SafeArrayDeleter {
    void operator()(SAFEARRAY* array) const noexcept { SafeArrayDestroy(array); }
};
// Owns a SAFEARRAY.
using UniqueSafeArray = std::unique_ptr<SAFEARRAY, SafeArrayDeleter>;

// A VARIANT that is cleared when it goes.
class Variant {
public:
    Variant() noexcept { VariantInit(&value_); }
    ~Variant() { VariantClear(&value_); }
    Variant(const Variant&) = delete;
    Variant& operator=(const Variant&) = delete;

    VARIANT* Get() noexcept { return &value_; }
    const VARIANT* Get() const noexcept { return &value_; }
    VARIANT* operator->() noexcept { return &value_; }
    const VARIANT* operator->() const noexcept { return &value_; }
    void Clear() noexcept { VariantClear(&value_); }

private:
    VARIANT value_;
};

} // namespace ut
