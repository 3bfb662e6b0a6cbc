// The message family: catalog and error-handling objects, resource strings, common-dialog error
// texts and the file dialogs.
#include <cstring>
#include <cwchar>
#include <memory>

#include <ut/catalog.h>
#include <ut/detail/names.h>
#include <ut/platform/file_search.h>
#include <ut/sdk/dialogs.h>
#include <ut/sdk/resources.h>

#include "module/state.h"

// The platform's record is 88 bytes on the 32-bit home, which is what the dialogs check.
static_assert(sizeof(void*) != 4 || sizeof(OPENFILENAMEW) == 88);

namespace ut::util {
namespace {

// First buffer of KXLoadString, in characters.
constexpr std::size_t kFirstStringCapacity = ut::kPathCapacity;

struct DialogError {
    DWORD code;
    unsigned short entry;
};

// The "QVXUT" entries of the common dialogs' error codes. Code 4 has entry 6050, out of sequence,
// and entry 6023 is not used: the dictionary was numbered that way and stays so.
constexpr DialogError kDialogErrors[] = {
    {CDERR_DIALOGFAILURE, 6022},   {CDERR_STRUCTSIZE, 6024},      {CDERR_INITIALIZATION, 6025},
    {CDERR_NOTEMPLATE, 6026},      {CDERR_NOHINSTANCE, 6050},     {CDERR_LOADSTRFAILURE, 6027},
    {CDERR_FINDRESFAILURE, 6028},  {CDERR_LOADRESFAILURE, 6029},  {CDERR_LOCKRESFAILURE, 6030},
    {CDERR_MEMALLOCFAILURE, 6031}, {CDERR_MEMLOCKFAILURE, 6032},  {CDERR_NOHOOK, 6033},
    {CFERR_NOFONTS, 6045},         {FNERR_SUBCLASSFAILURE, 6046}, {FNERR_INVALIDFILENAME, 6047},
    {FNERR_BUFFERTOOSMALL, 6048},
};
// The printer dialog's codes, in order from PDERR_SETUPFAILURE, take entries from 6034.
constexpr unsigned short kFirstPrinterEntry = 6034;
constexpr unsigned short kUnknownErrorEntry = 6049;

unsigned short DialogErrorEntry(DWORD code) {
    if (code >= PDERR_SETUPFAILURE && code <= PDERR_PRINTERNOTFOUND)
        return static_cast<unsigned short>(kFirstPrinterEntry + (code - PDERR_SETUPFAILURE));
    for (const DialogError& error : kDialogErrors)
        if (error.code == code)
            return error.entry;
    return kUnknownErrorEntry;
}

constexpr DWORD kSaveFlags = OFN_EXPLORER | OFN_LONGNAMES;
constexpr DWORD kLoadFlags = OFN_EXPLORER | OFN_LONGNAMES | OFN_FILEMUSTEXIST | OFN_ALLOWMULTISELECT;

enum class Dialog { Save, Load };

int RunFileDialog(Dialog dialog, HWND owner, wchar_t* title, const wchar_t* filter, const wchar_t* initialDir,
                  wchar_t* file, int fileSize) {
    OPENFILENAMEW record;
    std::memset(&record, 0, sizeof record);
    record.lStructSize = sizeof record;
    record.hwndOwner = owner;
    record.hInstance = ut::module::Current().instance;
    record.lpstrFilter = filter;
    record.lpstrFile = file;
    record.nMaxFile = static_cast<DWORD>(fileSize);
    record.lpstrInitialDir = initialDir;
    record.lpstrTitle = title;
    record.Flags = dialog == Dialog::Save ? kSaveFlags : kLoadFlags;
    record.lpstrDefExt = L"avi";
    ut::ComPtr<IGWFileDialogs> dialogs;
    if (FAILED(KXGetFileDialogs(dialogs.Put())))
        return 0;
    HRESULT hr = dialog == Dialog::Save ? dialogs->ShowSaveDialog(&record) : dialogs->ShowOpenDialog(&record);
    return hr == S_OK ? 1 : 0;
}

// Whether `path` names a folder, as the platform's file search sees it.
bool IsFolder(const wchar_t* path) {
    WIN32_FIND_DATAW found;
    std::memset(&found, 0, sizeof found);
    ut::platform::UniqueFind search(FindFirstFileW(path, &found));
    return search.Valid() && (found.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
}

using TaskString = std::unique_ptr<wchar_t, ut::TaskMemDeleter>;

// Reallocates the block to `characters` characters; on failure the block is freed.
bool Resize(TaskString& block, std::size_t characters) {
    void* grown = CoTaskMemRealloc(block.get(), characters * sizeof(wchar_t));
    if (!grown)
        return false;
    (void)block.release(); // now owned by `grown`
    block.reset(static_cast<wchar_t*>(grown));
    return true;
}

} // namespace
} // namespace ut::util

C3DCatalog::C3DCatalog(const wchar_t* name) : CKXCatalog(name) {}

HRESULT C3DCatalog::LogMsg(ULONG kind, ULONG messageId, ...) {
    va_list arguments;
    va_start(arguments, messageId);
    CKXString text;
    HRESULT hr = GetMsgEx(text, messageId, arguments);
    va_end(arguments);
    if (FAILED(hr))
        return hr;
    if (hr = KXLogMessage(kind, text, nullptr, nullptr); FAILED(hr))
        return hr;
    return S_OK;
}

C3DErrorHandling::~C3DErrorHandling() = default;

wchar_t* C3DErrorHandling::GetCatalogName() {
    return const_cast<wchar_t*>(ut::kCatalogName);
}

HRESULT C3DErrorHandling::LogMessage(CKXMsgString& message) {
    return KXLogMessage(message, KXLOG_ERROR);
}

wchar_t* KXLoadString(HINSTANCE module, unsigned int id) {
    using ut::util::TaskString;
    const wchar_t* text = KXDictLoadInstanceIdstring(module, id);
    TaskString block;
    std::size_t capacity = ut::util::kFirstStringCapacity;
    std::size_t length = 0;
    for (;;) {
        if (!ut::util::Resize(block, capacity))
            return nullptr;
        std::wcsncpy(block.get(), text, capacity);
        length = wcsnlen(block.get(), capacity);
        // Three characters of room tell a text that fits from one that was cut.
        if (length <= capacity - 3)
            break;
        capacity *= 2;
    }
    if (!ut::util::Resize(block, length + 1))
        return nullptr;
    block.get()[length] = L'\0';
    return block.release();
}

void KXGetCDError(DWORD code, wchar_t* buffer, int size) {
    if (code == 0 || !buffer || size <= 0)
        return;
    const wchar_t* text = DictLoadIdstring(ut::kDictionaryName, ut::util::DialogErrorEntry(code));
    std::wcsncpy(buffer, text, static_cast<std::size_t>(size));
}

int KXSelectSaveFileName(wchar_t* title, const wchar_t* filter, const wchar_t* initialDir, wchar_t* file,
                         int fileSize) {
    return ut::util::RunFileDialog(ut::util::Dialog::Save, nullptr, title, filter, initialDir, file,
                                   fileSize);
}

int KXSelectLoadFileName(wchar_t* title, const wchar_t* filter, const wchar_t* initialDir, wchar_t* file,
                         int fileSize) {
    return ut::util::RunFileDialog(ut::util::Dialog::Load, nullptr, title, filter, initialDir, file,
                                   fileSize);
}

int KXSelectLoadFileNameEx(HWND owner, wchar_t* title, const wchar_t* filter, const wchar_t* initialDir,
                           wchar_t* file, int fileSize) {
    return ut::util::RunFileDialog(ut::util::Dialog::Load, owner, title, filter, initialDir, file, fileSize);
}

void KXReplaceEmbededNullCharByChar(wchar_t* text, wchar_t ch) {
    if (!text || std::wcschr(text, ch) || !ut::util::IsFolder(text))
        return;
    for (wchar_t* piece = text; *piece;) {
        std::size_t length = std::wcslen(piece);
        piece[length] = ch;
        piece += length + 1;
    }
}
