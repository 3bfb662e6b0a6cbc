// Messages and error text: a catalog that formats and logs a numbered message in one call, the
// error-handling object bound to the library's catalog, resource strings of any length, the texts
// of the common dialogs' error codes, and the file dialogs.
#pragma once

#include <cstdarg>

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/platform/dialogs.h>
#include <ut/sdk/catalog.h>

class UT_API C3DCatalog : public CKXCatalog {
public:
    explicit C3DCatalog(const wchar_t* name);

    // Formats message `messageId` with the arguments that follow and logs it as `kind`. The first
    // failure: formatting (then nothing is logged), then logging.
    HRESULT LogMsg(ULONG kind, ULONG messageId, ...);
};

// Reports the messages of the "kxmsgcat" catalog as errors.
class UT_API C3DErrorHandling : public CKXErrorHandling {
public:
    C3DErrorHandling() = default;
    C3DErrorHandling(const C3DErrorHandling&) = default;
    C3DErrorHandling& operator=(const C3DErrorHandling&) = default;
    ~C3DErrorHandling() override;

    // "kxmsgcat".
    wchar_t* GetCatalogName() override;
    // KXLogMessage(message, KXLOG_ERROR).
    HRESULT LogMessage(CKXMsgString& message) override;
};

// A task-allocated copy of entry `id` of the dictionary `module` registered, however long; the
// caller frees it with CoTaskMemFree. A missing entry gives an empty string; null only when memory
// runs out.
UT_API wchar_t* KXLoadString(HINSTANCE module, unsigned int id);

// Copies the text of common-dialog error `code` from the "QVXUT" dictionary into `buffer`: at
// most `size` characters, terminated only when the text is shorter. Code 0 leaves the buffer as it
// was. Unknown codes give the text of entry 6049.
UT_API void KXGetCDError(DWORD code, wchar_t* buffer, int size);

// Run the application's save or open dialog (see IGWFileDialogs) with `file` (of `fileSize`
// characters) as the initial name and the answer, `filter` and `initialDir` as the platform's
// dialog takes them, and "avi" as the default extension. The open dialogs require an existing file
// and allow a multiple selection. Non-zero when the user chose; 0 when cancelled, on error, or
// without a dialog service (the service's GetExtendedError then says why).
UT_API int KXSelectSaveFileName(wchar_t* title, const wchar_t* filter, const wchar_t* initialDir,
                                wchar_t* file, int fileSize);
UT_API int KXSelectLoadFileName(wchar_t* title, const wchar_t* filter, const wchar_t* initialDir,
                                wchar_t* file, int fileSize);
UT_API int KXSelectLoadFileNameEx(HWND owner, wchar_t* title, const wchar_t* filter,
                                  const wchar_t* initialDir, wchar_t* file, int fileSize);

// Turns a multiple selection (folder, names, each terminated, then an empty string) into one
// string with `ch` after every piece: C:\dir, a.avi, b.avi become "C:\dir|a.avi|b.avi|" for '|'.
// Nothing changes when `text` already holds `ch` (it is taken as converted) or does not name a
// folder (a single selection is a file path).
UT_API void KXReplaceEmbededNullCharByChar(wchar_t* text, wchar_t ch);
