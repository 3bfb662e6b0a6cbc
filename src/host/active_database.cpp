// The reference host's active database: the mode it reports.
#include "active_database.h"

#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

namespace ut::host {

std::span<const CGWCOMObject::InterfaceEntry> ActiveDatabase::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<ActiveDatabase, IGWActiveDatabase>(IID_IGWActiveDatabase)};
    return map;
}

HRESULT ActiveDatabase::GetCurrentMode(ULONG* mode) {
    if (!mode)
        return E_POINTER;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabase::GetCurrentMode"); FAILED(hr))
        return hr;
    *mode = mode_;
    return S_OK;
}

} // namespace ut::host
