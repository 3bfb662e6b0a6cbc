// The host's variant: a VARIANT that may also hold a GUID.
#pragma once

#include <ut/platform/variant.h>
#include <ut/sdk/export.h>

// A GUID held by a VARIANT: `byref` points to a task-allocated GUID that the variant owns.
// Only GWVariantClear frees it (the system's VariantClear does not know the type), so a GUID is
// never an element of a SAFEARRAY.
inline constexpr VARTYPE GW_VT_GUID = 96;

// Clears a variant of any type VariantClear knows, and GW_VT_GUID.
UT_SDK_API HRESULT GWVariantClear(VARIANT* value);
// Makes `value` (already cleared) hold a copy of `guid`.
UT_SDK_API HRESULT GWVariantSetGUID(VARIANT* value, REFGUID guid);
