// Byte arrays on POSIX: over a file (with atomic replacement of the whole content) and over a
// global memory block.
#include "posix/lockbytes.h"

#include <algorithm>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <new>
#include <random>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

#include <ut/platform/detail/boundary.h>

#include "common/lockbytes_base.h"
#include "common/stream_base.h"
#include "posix/descriptor.h"
#include "posix/path.h"

namespace ut::platform::posix {
namespace {

bool CanWrite(DWORD mode) {
    return (mode & 3) != STGM_READ;
}

std::string FolderOf(const std::string& path) {
    std::string folder = std::filesystem::path(path).parent_path().string();
    return folder.empty() ? "." : folder;
}

// Makes sure a file's new name and content reach the disk before anyone relies on them.
void SyncFolderOf(const std::string& path) {
    int fd = ::open(FolderOf(path).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (fd < 0)
        return;
    (void)::fsync(fd); // the rename is done; a folder that cannot sync loses only durability
    ::close(fd);
}

class FileLockBytes final : public LockBytesBase, public FileBytes {
public:
    FileLockBytes(int fd, std::string path, std::wstring shownPath, DWORD mode)
        : fd_(fd), path_(std::move(path)), shownPath_(std::move(shownPath)), mode_(mode) {}

    HRESULT STDMETHODCALLTYPE ReadAt(ULARGE_INTEGER offset, void* buffer, ULONG count, ULONG* read) override {
        if (HRESULT hr = BeginTransfer(buffer, count, read); FAILED(hr))
            return hr;
        std::size_t done = 0;
        HRESULT hr = PreadFully(fd_, offset.QuadPart, buffer, count, done);
        if (read)
            *read = static_cast<ULONG>(done);
        return hr;
    }

    HRESULT STDMETHODCALLTYPE WriteAt(ULARGE_INTEGER offset, const void* buffer, ULONG count,
                                      ULONG* written) override {
        if (HRESULT hr = BeginTransfer(buffer, count, written); FAILED(hr))
            return hr;
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        std::size_t done = 0;
        HRESULT hr = PwriteFully(fd_, offset.QuadPart, buffer, count, done);
        if (written)
            *written = static_cast<ULONG>(done);
        return hr;
    }

    HRESULT STDMETHODCALLTYPE Flush() override {
        if (!CanWrite(mode_) || ::fdatasync(fd_) == 0)
            return S_OK;
        return StorageError(errno, STG_E_WRITEFAULT);
    }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        return ::ftruncate(fd_, static_cast<off_t>(size.QuadPart)) == 0
                   ? S_OK
                   : StorageError(errno, STG_E_WRITEFAULT);
    }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        struct stat info {};
        if (::fstat(fd_, &info) != 0)
            return StorageError(errno, STG_E_READFAULT);
        return FillStatRecord(stat, flags, STGTY_LOCKBYTES, static_cast<ULONGLONG>(info.st_size), shownPath_,
                              mode_);
    }

    HRESULT BeginReplacement(int& fd) override {
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        if (replacement_ < 0) {
            // Nameless until the commit names it, so that a crash while it is written leaves
            // nothing beside the file; a named one where the file system cannot do that.
            replacement_ = ::open(FolderOf(path_).c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, 0600);
            if (replacement_ < 0)
                if (HRESULT hr = NewNamedReplacement(); FAILED(hr))
                    return hr;
        }
        fd = replacement_;
        return S_OK;
    }

    HRESULT FinishReplacement(bool durable) override {
        if (replacement_ < 0)
            return E_UNEXPECTED;
        if (durable && ::fdatasync(replacement_) != 0)
            return StorageError(errno, STG_E_WRITEFAULT);
        // Named only now, so that it has a name beside the file for the moment of the rename.
        if (replacementPath_.empty())
            if (HRESULT hr = NameReplacement(durable); FAILED(hr))
                return hr;
        struct stat info {};
        if (::fstat(fd_, &info) == 0)
            (void)::fchmod(replacement_, info.st_mode & 07777); // the owner's default is only less open
        if (::rename(replacementPath_.c_str(), path_.c_str()) != 0)
            return StorageError(errno, STG_E_WRITEFAULT);
        if (durable)
            SyncFolderOf(path_);
        ::close(fd_);
        fd_ = std::exchange(replacement_, -1);
        replacementPath_.clear();
        return S_OK;
    }

    void AbandonReplacement() override {
        if (replacement_ < 0)
            return;
        if (!replacementPath_.empty())
            (void)::unlink(replacementPath_.c_str()); // the old file stays as it was
        ::close(std::exchange(replacement_, -1));
        replacementPath_.clear();
    }

    const std::wstring& Path() const override { return shownPath_; }

    void DeleteOnRelease() { deleteOnRelease_ = true; }

private:
    HRESULT NewNamedReplacement() {
        std::string temporary = path_ + ".XXXXXX";
        replacement_ = ::mkostemp(temporary.data(), O_CLOEXEC);
        if (replacement_ < 0)
            return StorageError(errno, STG_E_WRITEFAULT);
        replacementPath_ = std::move(temporary);
        return S_OK;
    }

    // Gives the nameless replacement a temporary name beside the file, through its /proc link;
    // without /proc its bytes are copied into a named file.
    HRESULT NameReplacement(bool durable) {
        std::string link = "/proc/self/fd/" + std::to_string(replacement_);
        std::random_device random;
        for (int attempt = 0; attempt < 16; ++attempt) {
            std::string name = path_ + "." + std::to_string(random() % 1000000);
            if (::linkat(AT_FDCWD, link.c_str(), AT_FDCWD, name.c_str(), AT_SYMLINK_FOLLOW) == 0) {
                replacementPath_ = std::move(name);
                return S_OK;
            }
            if (errno != EEXIST)
                break;
        }
        int nameless = std::exchange(replacement_, -1);
        HRESULT hr = NewNamedReplacement();
        if (SUCCEEDED(hr))
            hr = CopyWhole(nameless, replacement_);
        if (SUCCEEDED(hr) && durable && ::fdatasync(replacement_) != 0)
            hr = StorageError(errno, STG_E_WRITEFAULT);
        ::close(nameless);
        if (FAILED(hr))
            AbandonReplacement();
        return hr;
    }

    static HRESULT CopyWhole(int from, int to) {
        off_t size = ::lseek(from, 0, SEEK_END);
        loff_t in = 0;
        loff_t out = 0;
        while (in < size) {
            ssize_t copied = ::copy_file_range(from, &in, to, &out, static_cast<std::size_t>(size - in), 0);
            if (copied < 0 && errno == EINTR)
                continue;
            if (copied <= 0)
                return StorageError(copied < 0 ? errno : EIO, STG_E_WRITEFAULT);
        }
        return size < 0 ? StorageError(errno, STG_E_WRITEFAULT) : S_OK;
    }

    ~FileLockBytes() override {
        AbandonReplacement();
        ::close(fd_);
        if (deleteOnRelease_)
            (void)::unlink(path_.c_str()); // nothing to report to at the last release
    }

    int fd_;
    std::string path_;
    std::wstring shownPath_;
    DWORD mode_;
    bool deleteOnRelease_ = false;
    // The temporary file beside that is to replace the file, while there is one.
    int replacement_ = -1;
    std::string replacementPath_;
};

// A byte array over a global memory block: the block's size is the array's size, and the
// block grows with writes past its end.
class GlobalLockBytes final : public LockBytesBase {
public:
    GlobalLockBytes(HGLOBAL block, bool deleteOnRelease) : block_(block), deleteOnRelease_(deleteOnRelease) {}

    HRESULT STDMETHODCALLTYPE ReadAt(ULARGE_INTEGER offset, void* buffer, ULONG count, ULONG* read) override {
        if (HRESULT hr = BeginTransfer(buffer, count, read); FAILED(hr))
            return hr;
        ULONGLONG size = GlobalSize(block_);
        if (offset.QuadPart >= size || count == 0)
            return S_OK;
        ULONG copied = static_cast<ULONG>(std::min<ULONGLONG>(count, size - offset.QuadPart));
        GlobalLockGuard lock(block_);
        if (!lock.Data())
            return STG_E_INVALIDHANDLE;
        std::memcpy(buffer, static_cast<const char*>(lock.Data()) + offset.QuadPart, copied);
        if (read)
            *read = copied;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE WriteAt(ULARGE_INTEGER offset, const void* buffer, ULONG count,
                                      ULONG* written) override {
        if (HRESULT hr = BeginTransfer(buffer, count, written); FAILED(hr))
            return hr;
        if (count == 0)
            return S_OK;
        ULONGLONG end = offset.QuadPart + count;
        if (end > GlobalSize(block_)) {
            ULARGE_INTEGER size{};
            size.QuadPart = end;
            if (HRESULT hr = SetSize(size); FAILED(hr))
                return hr;
        }
        GlobalLockGuard lock(block_);
        if (!lock.Data())
            return STG_E_INVALIDHANDLE;
        std::memcpy(static_cast<char*>(lock.Data()) + offset.QuadPart, buffer, count);
        if (written)
            *written = count;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Flush() override { return S_OK; }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        SIZE_T old = GlobalSize(block_);
        if (size.QuadPart == old)
            return S_OK;
        if (!GlobalReAlloc(block_, static_cast<SIZE_T>(size.QuadPart), GMEM_MOVEABLE))
            return STG_E_MEDIUMFULL;
        if (size.QuadPart > old) {
            GlobalLockGuard lock(block_);
            if (lock.Data())
                std::memset(static_cast<char*>(lock.Data()) + old, 0, size.QuadPart - old);
        }
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        return FillStatRecord(stat, flags, STGTY_LOCKBYTES, GlobalSize(block_), std::wstring(),
                              STGM_READWRITE);
    }

private:
    ~GlobalLockBytes() override {
        if (deleteOnRelease_)
            (void)GlobalFree(block_); // ours to free; nothing to report at the last release
    }

    HGLOBAL block_;
    bool deleteOnRelease_;
};

} // namespace

FileBytes* FileBehind(ILockBytes* bytes) {
    auto* file = dynamic_cast<FileLockBytes*>(bytes);
    return file && !file->Path().empty() ? static_cast<FileBytes*>(file) : nullptr;
}

HRESULT OpenFileBytes(const std::string& path, DWORD mode, Disposition disposition, ILockBytes** bytes) {
    static constexpr int kCreation[] = {0, O_CREAT, O_CREAT | O_EXCL, O_CREAT | O_TRUNC};
    int flags = O_CLOEXEC | (CanWrite(mode) ? O_RDWR : O_RDONLY) | kCreation[static_cast<int>(disposition)];
    int fd = ::open(path.c_str(), flags, 0666);
    if (fd < 0 && errno == ENOENT && disposition != Disposition::Existing)
        return STG_E_PATHNOTFOUND;
    if (fd < 0)
        return StorageError(errno, STG_E_ACCESSDENIED);
    struct stat info {};
    if (::fstat(fd, &info) != 0 || S_ISDIR(info.st_mode)) {
        ::close(fd);
        return STG_E_ACCESSDENIED;
    }
    return ut::ExportBoundary([&] {
        std::error_code error;
        std::filesystem::path absolute = std::filesystem::canonical(path, error);
        std::string resolved = error ? path : absolute.string();
        auto* file = new FileLockBytes(fd, resolved, WideFromUtf8(resolved), mode & ~STGM_DELETEONRELEASE);
        if (mode & STGM_DELETEONRELEASE)
            file->DeleteOnRelease();
        *bytes = file;
        return S_OK;
    });
}

HRESULT CreateScratchFile(int& fd) {
    std::error_code error;
    std::string pattern = (std::filesystem::temp_directory_path(error) / "ut-scratch-XXXXXX").string();
    fd = ::mkostemp(pattern.data(), O_CLOEXEC);
    if (fd < 0)
        return StorageError(errno, STG_E_WRITEFAULT);
    (void)::unlink(pattern.c_str()); // nameless from now on, it goes when closed
    return S_OK;
}

} // namespace ut::platform::posix

namespace ut::platform {

HRESULT OpenFileLockBytes(const wchar_t* path, DWORD mode, ILockBytes** bytes) {
    if (!bytes)
        return E_POINTER;
    *bytes = nullptr;
    if (!path || !*path)
        return STG_E_INVALIDNAME;
    if ((mode & 3) == 3)
        return STG_E_INVALIDFLAG;
    auto disposition = (mode & STGM_CREATE) ? posix::Disposition::Truncate : posix::Disposition::Existing;
    return ut::ExportBoundary(
        [&] { return posix::OpenFileBytes(posix::SystemPath(path), mode, disposition, bytes); });
}

} // namespace ut::platform

extern "C" HRESULT CreateILockBytesOnHGlobal(HGLOBAL block, BOOL deleteOnRelease, ILockBytes** bytes) {
    if (!bytes)
        return E_INVALIDARG;
    *bytes = nullptr;
    bool ownBlock = !block;
    if (ownBlock && !(block = GlobalAlloc(GMEM_MOVEABLE, 0)))
        return E_OUTOFMEMORY;
    *bytes = new (std::nothrow) ut::platform::posix::GlobalLockBytes(block, ownBlock || deleteOnRelease);
    if (*bytes)
        return S_OK;
    if (ownBlock)
        (void)GlobalFree(block); // never handed out
    return E_OUTOFMEMORY;
}
