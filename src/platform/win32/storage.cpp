// Byte arrays over files on Windows: the system has none of its own, so this one reads and
// writes a file handle at the offsets asked for.
#include <new>
#include <string>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/storage.h>

#include "common/lockbytes_base.h"
#include "common/stream_base.h"

namespace ut::platform {
namespace {

bool CanWrite(DWORD mode) {
    return (mode & 3) != STGM_READ;
}

HRESULT StorageCodeOfLastError() {
    switch (GetLastError()) {
    case ERROR_FILE_NOT_FOUND:
    case ERROR_PATH_NOT_FOUND:
        return STG_E_FILENOTFOUND;
    case ERROR_ACCESS_DENIED:
        return STG_E_ACCESSDENIED;
    case ERROR_SHARING_VIOLATION:
        return STG_E_SHAREVIOLATION;
    case ERROR_HANDLE_DISK_FULL:
    case ERROR_DISK_FULL:
        return STG_E_MEDIUMFULL;
    default:
        return HRESULT_FROM_WIN32(GetLastError());
    }
}

OVERLAPPED At(ULARGE_INTEGER offset) {
    OVERLAPPED at{};
    at.Offset = offset.u.LowPart;
    at.OffsetHigh = offset.u.HighPart;
    return at;
}

class FileLockBytes final : public LockBytesBase {
public:
    FileLockBytes(HANDLE file, std::wstring path, DWORD mode)
        : file_(file), path_(std::move(path)), mode_(mode) {}

    HRESULT STDMETHODCALLTYPE ReadAt(ULARGE_INTEGER offset, void* buffer, ULONG count, ULONG* read) override {
        if (HRESULT hr = BeginTransfer(buffer, count, read); FAILED(hr))
            return hr;
        OVERLAPPED at = At(offset);
        DWORD done = 0;
        if (!ReadFile(file_, buffer, count, &done, &at) && GetLastError() != ERROR_HANDLE_EOF)
            return StorageCodeOfLastError();
        if (read)
            *read = done;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE WriteAt(ULARGE_INTEGER offset, const void* buffer, ULONG count,
                                      ULONG* written) override {
        if (HRESULT hr = BeginTransfer(buffer, count, written); FAILED(hr))
            return hr;
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        OVERLAPPED at = At(offset);
        DWORD done = 0;
        if (!WriteFile(file_, buffer, count, &done, &at))
            return StorageCodeOfLastError();
        if (written)
            *written = done;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Flush() override {
        return !CanWrite(mode_) || FlushFileBuffers(file_) ? S_OK : StorageCodeOfLastError();
    }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        LARGE_INTEGER end{};
        end.QuadPart = static_cast<LONGLONG>(size.QuadPart);
        if (!SetFilePointerEx(file_, end, nullptr, FILE_BEGIN) || !SetEndOfFile(file_))
            return StorageCodeOfLastError();
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        LARGE_INTEGER size{};
        if (!GetFileSizeEx(file_, &size))
            return StorageCodeOfLastError();
        return FillStatRecord(stat, flags, STGTY_LOCKBYTES, static_cast<ULONGLONG>(size.QuadPart), path_,
                              mode_);
    }

private:
    ~FileLockBytes() override { CloseHandle(file_); }

    HANDLE file_;
    std::wstring path_;
    DWORD mode_;
};

DWORD ShareOf(DWORD mode) {
    switch (mode & 0x70) {
    case STGM_SHARE_EXCLUSIVE:
        return 0;
    case STGM_SHARE_DENY_WRITE:
        return FILE_SHARE_READ;
    case STGM_SHARE_DENY_READ:
        return FILE_SHARE_WRITE;
    default:
        return FILE_SHARE_READ | FILE_SHARE_WRITE;
    }
}

} // namespace

HRESULT OpenFileLockBytes(const wchar_t* path, DWORD mode, ILockBytes** bytes) {
    if (!bytes)
        return E_POINTER;
    *bytes = nullptr;
    if (!path || !*path)
        return STG_E_INVALIDNAME;
    if ((mode & 3) == 3)
        return STG_E_INVALIDFLAG;
    DWORD access = GENERIC_READ | (CanWrite(mode) ? GENERIC_WRITE : 0);
    DWORD creation = (mode & STGM_CREATE) ? CREATE_ALWAYS : OPEN_EXISTING;
    DWORD flags = FILE_ATTRIBUTE_NORMAL | ((mode & STGM_DELETEONRELEASE) ? FILE_FLAG_DELETE_ON_CLOSE : 0);
    HANDLE file = CreateFileW(path, access, ShareOf(mode), nullptr, creation, flags, nullptr);
    if (file == INVALID_HANDLE_VALUE)
        return StorageCodeOfLastError();
    HRESULT hr = ut::ExportBoundary([&] {
        *bytes = new FileLockBytes(file, path, mode & ~(STGM_CREATE | STGM_DELETEONRELEASE));
        return S_OK;
    });
    if (FAILED(hr))
        CloseHandle(file);
    return hr;
}

} // namespace ut::platform
