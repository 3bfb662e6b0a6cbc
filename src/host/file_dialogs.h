// The reference host's file dialogs. The host has no desktop to show a dialog on, so every dialog
// answers cancelled, with CDERR_DIALOGFAILURE as its extended error (CDERR_STRUCTSIZE when the
// record's size is not the platform's).
#pragma once

#include <atomic>

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/dialogs.h>

namespace ut::host {

class FileDialogs final : public ut::sdk::ComObject<IGWFileDialogs> {
public:
    explicit FileDialogs(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE ShowOpenDialog(OPENFILENAMEW* record) override;
    HRESULT STDMETHODCALLTYPE ShowSaveDialog(OPENFILENAMEW* record) override;
    HRESULT STDMETHODCALLTYPE GetExtendedError(DWORD* code) override;

private:
    HRESULT Show(std::string_view operation, OPENFILENAMEW* record);

    std::atomic<DWORD> lastError_{0};
};

} // namespace ut::host
