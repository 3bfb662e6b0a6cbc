// Data transfer on POSIX: releasing media, reading dropped-file lists and the process's table
// of registered clipboard formats.
#include <algorithm>
#include <cstring>
#include <cwctype>
#include <mutex>
#include <string>
#include <vector>

#include <ut/platform/bitmap.h>
#include <ut/platform/dataobject.h>
#include <ut/platform/detail/boundary.h>
#include <ut/platform/files.h>
#include <ut/platform/text.h>

#include "posix/letters.h"

namespace {

constexpr UINT kFirstRegisteredFormat = 0xC000;
constexpr UINT kQueryCount = 0xFFFFFFFF;

struct FormatTable {
    std::mutex mutex;
    std::vector<std::wstring> names;
};

FormatTable& Formats() {
    static FormatTable* table = new FormatTable;
    return *table;
}

bool SameName(const std::wstring& a, const wchar_t* b) {
    std::size_t length = std::wcslen(b);
    return a.size() == length && std::equal(a.begin(), a.end(), b, ut::platform::posix::SameLetter);
}

// The names of a DROPFILES block, read within the block's bounds.
std::vector<std::wstring> DroppedNames(const std::uint8_t* block, SIZE_T size) {
    std::vector<std::wstring> names;
    DROPFILES header;
    if (size < sizeof header)
        return names;
    std::memcpy(&header, block, sizeof header);
    std::size_t unit = header.fWide ? sizeof(wchar_t) : 1;
    std::size_t at = header.pFiles;
    auto unitAt = [&](std::size_t offset) {
        wchar_t wide = 0;
        if (header.fWide)
            std::memcpy(&wide, block + offset, sizeof wide);
        return header.fWide ? wide : static_cast<wchar_t>(block[offset]);
    };
    while (at + unit <= size && unitAt(at) != 0) {
        std::wstring name;
        std::string narrow;
        for (; at + unit <= size && unitAt(at) != 0; at += unit) {
            if (header.fWide)
                name.push_back(unitAt(at));
            else
                narrow.push_back(static_cast<char>(block[at]));
        }
        at += unit;
        names.push_back(header.fWide ? name : ut::platform::WideFromUtf8(narrow));
    }
    return names;
}

} // namespace

extern "C" {

void ReleaseStgMedium(STGMEDIUM* medium) {
    if (!medium)
        return;
    bool owned = medium->pUnkForRelease == nullptr;
    switch (medium->tymed) {
    case TYMED_HGLOBAL:
        if (owned && medium->hGlobal)
            (void)GlobalFree(medium->hGlobal); // a stray handle is not ours to report
        break;
    case TYMED_FILE:
        if (medium->lpszFileName && owned)
            (void)DeleteFileW(medium->lpszFileName); // the file may already be gone
        CoTaskMemFree(medium->lpszFileName);
        break;
    case TYMED_ISTREAM:
        if (medium->pstm)
            medium->pstm->Release();
        break;
    case TYMED_ISTORAGE:
        if (medium->pstg)
            medium->pstg->Release();
        break;
    case TYMED_GDI:
        if (owned && medium->hBitmap)
            (void)DeleteObject(medium->hBitmap); // a bitmap still selected stays with its owner
        break;
    default:
        break;
    }
    if (medium->pUnkForRelease)
        medium->pUnkForRelease->Release();
}

UINT DragQueryFileW(HDROP drop, UINT index, LPWSTR buffer, UINT size) {
    return ut::ExportBoundary(
        [&]() -> UINT {
            ut::GlobalLockGuard lock(drop);
            if (!lock.Data())
                return 0;
            std::vector<std::wstring> names =
                DroppedNames(static_cast<const std::uint8_t*>(lock.Data()), GlobalSize(drop));
            if (index == kQueryCount)
                return static_cast<UINT>(names.size());
            if (index >= names.size())
                return 0;
            const std::wstring& name = names[index];
            if (!buffer)
                return static_cast<UINT>(name.size());
            if (size == 0)
                return 0;
            std::size_t copied = std::min<std::size_t>(name.size(), size - 1);
            std::wmemcpy(buffer, name.data(), copied);
            buffer[copied] = L'\0';
            return static_cast<UINT>(copied);
        },
        UINT{0});
}

UINT RegisterClipboardFormatW(LPCWSTR name) {
    if (!name || !*name) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return 0;
    }
    return ut::ExportBoundary(
        [&]() -> UINT {
            FormatTable& table = Formats();
            std::lock_guard lock(table.mutex);
            auto found = std::find_if(table.names.begin(), table.names.end(),
                                      [&](const std::wstring& known) { return SameName(known, name); });
            if (found != table.names.end())
                return kFirstRegisteredFormat + static_cast<UINT>(found - table.names.begin());
            if (table.names.size() >= 0x10000 - kFirstRegisteredFormat) {
                SetLastError(ERROR_NOT_ENOUGH_MEMORY);
                return 0;
            }
            table.names.emplace_back(name);
            return kFirstRegisteredFormat + static_cast<UINT>(table.names.size() - 1);
        },
        UINT{0});
}

} // extern "C"
