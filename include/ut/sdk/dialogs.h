// The application's file dialogs: the open and save dialogs run over the platform's request
// record, and the extended error of the last one.
#pragma once

#include <ut/platform/com.h>
#include <ut/platform/dialogs.h>
#include <ut/sdk/export.h>

// {53D07AA3-F67E-41C6-8861-080DB5C8E289} (the reference host's; an application installs its own
// service under this class)
inline constexpr CLSID CLSID_GWFileDialogs = {
    0x53D07AA3, 0xF67E, 0x41C6, {0x88, 0x61, 0x08, 0x0D, 0xB5, 0xC8, 0xE2, 0x89}};
// {53D07AA4-F67E-41C6-8861-080DB5C8E289}
inline constexpr IID IID_IGWFileDialogs = {
    0x53D07AA4, 0xF67E, 0x41C6, {0x88, 0x61, 0x08, 0x0D, 0xB5, 0xC8, 0xE2, 0x89}};

// The dialogs answer S_OK when the user chose a file (written into lpstrFile, a multiple
// selection as the folder, each name and an empty string, each terminated), S_FALSE when the
// dialog was cancelled or could not be shown (GetExtendedError says which), E_POINTER for a null
// record.
struct IGWFileDialogs : IUnknown {
    // Runs the open dialog over `record`.
    virtual HRESULT STDMETHODCALLTYPE ShowOpenDialog(OPENFILENAMEW* record) = 0;
    // Runs the save dialog over `record`.
    virtual HRESULT STDMETHODCALLTYPE ShowSaveDialog(OPENFILENAMEW* record) = 0;
    // The common-dialog error code of the last dialog (CDERR_..., FNERR_...); 0 after a choice or
    // a plain cancel.
    virtual HRESULT STDMETHODCALLTYPE GetExtendedError(DWORD* code) = 0;

protected:
    ~IGWFileDialogs() = default;
};

template <>
struct ut::InterfaceId<IGWFileDialogs> : ut::Iid<IID_IGWFileDialogs> {};

// The application's file-dialog service (found through GWQueryGenericObject).
UT_SDK_API HRESULT KXGetFileDialogs(IGWFileDialogs** dialogs);
