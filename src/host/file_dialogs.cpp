#include "file_dialogs.h"

#include <ut/sdk/testing.h>

namespace ut::host {

std::span<const CGWCOMObject::InterfaceEntry> FileDialogs::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<FileDialogs, IGWFileDialogs>(IID_IGWFileDialogs)};
    return map;
}

HRESULT FileDialogs::ShowOpenDialog(OPENFILENAMEW* record) {
    return Show("IGWFileDialogs::ShowOpenDialog", record);
}

HRESULT FileDialogs::ShowSaveDialog(OPENFILENAMEW* record) {
    return Show("IGWFileDialogs::ShowSaveDialog", record);
}

HRESULT FileDialogs::GetExtendedError(DWORD* code) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWFileDialogs::GetExtendedError"); FAILED(hr))
        return hr;
    if (!code)
        return E_POINTER;
    *code = lastError_.load();
    return S_OK;
}

HRESULT FileDialogs::Show(std::string_view operation, OPENFILENAMEW* record) {
    if (HRESULT hr = ut::sdk::CheckHostFault(operation); FAILED(hr))
        return hr;
    if (!record)
        return E_POINTER;
    lastError_ = record->lStructSize == sizeof(OPENFILENAMEW) ? CDERR_DIALOGFAILURE : CDERR_STRUCTSIZE;
    return S_FALSE;
}

} // namespace ut::host
