// What other subsystems of the library share of scene access.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/list.h>

namespace ut::scene {

// Clears an out-parameter, or answers `ifNull` when there is none.
template <class Out>
HRESULT ClearOut(Out** out, HRESULT ifNull = E_POINTER) {
    if (!out)
        return ifNull;
    *out = nullptr;
    return S_OK;
}

// The current scene's container kept under `key`, through `iid`: E_POINTER for a null `out`,
// which is cleared first.
HRESULT CurrentSceneContainer(REFGUID key, REFIID iid, void** out);

// Appends one element pointing at `target` to `list`; E_FAIL when any step fails.
HRESULT AppendToList(I3DList& list, IUnknown* target);

} // namespace ut::scene
