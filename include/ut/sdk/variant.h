// The host's variant: a VARIANT that may also hold a GUID.
#pragma once

#include <ut/platform/variant.h>
#include <ut/sdk/export.h>

// A GUID held by a VARIANT: `byref` points to a task-allocated GUID that the variant owns.
// Only GWVariantClear frees it (the system's VariantClear does not know the type), so a GUID is
// never an element of a SAFEARRAY.
inline constexpr VARTYPE GW_VT_GUID = 96;

using GWVARIANT = VARIANT;

// Clears a variant of any type VariantClear knows, and GW_VT_GUID.
UT_SDK_API HRESULT GWVariantClear(VARIANT* value);
// Makes `value` (already cleared) hold a copy of `guid`.
UT_SDK_API HRESULT GWVariantSetGUID(VARIANT* value, REFGUID guid);

// A GWVARIANT that starts empty (or holding a double) and is cleared with GWVariantClear when it
// goes. It is handed to the host as a `GWVARIANT*`.
class CGWVariant : public GWVARIANT {
public:
    CGWVariant() noexcept { VariantInit(this); }
    explicit CGWVariant(double value) noexcept {
        VariantInit(this);
        vt = VT_R8;
        dblVal = value;
    }
    ~CGWVariant() { Clear(); }
    CGWVariant(const CGWVariant&) = delete;
    CGWVariant& operator=(const CGWVariant&) = delete;

    void Clear() noexcept { (void)GWVariantClear(this); } // cannot fail on a variant it made
};
