// A variant that the host fills, cleared afterwards only when its type can own something.
#pragma once

#include <cstring>

#include <ut/sdk/variant.h>

namespace ut::util {

// Zeroed for the host to fill; cleared with GWVariantClear only for the string and object types
// from VT_BSTR up, except the boolean, which owns nothing.
class HostVariant {
public:
    HostVariant() noexcept { std::memset(&value_, 0, sizeof value_); }
    ~HostVariant() {
        if (value_.vt >= VT_BSTR && value_.vt != VT_BOOL)
            (void)GWVariantClear(&value_); // nothing to report from a destructor
    }
    HostVariant(const HostVariant&) = delete;
    HostVariant& operator=(const HostVariant&) = delete;

    GWVARIANT* Get() noexcept { return &value_; }

private:
    GWVARIANT value_;
};

} // namespace ut::util
