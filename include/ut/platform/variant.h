// VARIANT, BSTR and SAFEARRAY on both homes, and owners that release them on every path.
#pragma once

#include <memory>

#include <ut/platform/com.h>
#include <ut/platform/native/variant.h>

namespace ut {

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
