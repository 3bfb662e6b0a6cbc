// Streams on POSIX: growable streams in memory, and streams over files.
#include <cerrno>
#include <fcntl.h>
#include <memory>
#include <new>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/text.h>

#include "common/stream_base.h"
#include "posix/descriptor.h"
#include "posix/path.h"

// A growable stream in memory. Clones share the bytes and keep their own position, as the
// system's memory streams do.
namespace ut::platform::posix {
namespace {

using Bytes = std::vector<unsigned char>;

class MemoryStream final : public StreamBase {
public:
    explicit MemoryStream(std::shared_ptr<Bytes> bytes, ULONGLONG position = 0)
        : bytes_(std::move(bytes)), position_(position) {}

    HRESULT STDMETHODCALLTYPE Read(void* buffer, ULONG count, ULONG* read) override {
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        ULONG copied = 0;
        if (position_ < bytes_->size()) {
            copied = static_cast<ULONG>(std::min<ULONGLONG>(count, bytes_->size() - position_));
            std::memcpy(buffer, bytes_->data() + position_, copied);
            position_ += copied;
        }
        if (read)
            *read = copied;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Write(const void* buffer, ULONG count, ULONG* written) override {
        if (written)
            *written = 0;
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        if (count == 0)
            return S_OK;
        ULONGLONG end = position_ + count;
        if (end > kMaxMemorySize)
            return STG_E_MEDIUMFULL;
        if (end > bytes_->size() && !Grow(end))
            return STG_E_INSUFFICIENTMEMORY;
        std::memcpy(bytes_->data() + position_, buffer, count);
        position_ = end;
        if (written)
            *written = count;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) override {
        ULONGLONG target = 0;
        if (!NewPosition(move, origin, position_, bytes_->size(), target) || target > kMaxMemorySize)
            return STG_E_INVALIDFUNCTION;
        position_ = target;
        if (position)
            position->QuadPart = position_;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        if (size.QuadPart > kMaxMemorySize)
            return STG_E_MEDIUMFULL;
        return ut::ExportBoundary(
            [&] {
                bytes_->resize(size.QuadPart);
                return S_OK;
            },
            HRESULT{STG_E_INSUFFICIENTMEMORY});
    }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        return FillStat(stat, flags, bytes_->size(), std::wstring(), STGM_READWRITE);
    }

    HRESULT STDMETHODCALLTYPE Clone(IStream** clone) override {
        if (!clone)
            return STG_E_INVALIDPOINTER;
        *clone = new (std::nothrow) MemoryStream(bytes_, position_);
        return *clone ? S_OK : E_OUTOFMEMORY;
    }

private:
    bool Grow(ULONGLONG end) {
        return ut::ExportBoundary(
            [&] {
                if (end > bytes_->capacity())
                    bytes_->reserve(std::max<ULONGLONG>(end, bytes_->capacity() * 2));
                bytes_->resize(end);
                return true;
            },
            false);
    }

    std::shared_ptr<Bytes> bytes_;
    ULONGLONG position_;
};

} // namespace
} // namespace ut::platform::posix

namespace ut::platform {

HRESULT CreateMemoryStream(IStream** stream) {
    if (!stream)
        return E_POINTER;
    *stream = new (std::nothrow) posix::MemoryStream(std::make_shared<posix::Bytes>());
    return *stream ? S_OK : E_OUTOFMEMORY;
}

} // namespace ut::platform

// A stream over a file descriptor. Positions are our own, so reads and writes use pread and
// pwrite and the descriptor's offset is never shared state.
namespace ut::platform::posix {
namespace {

class FileStream final : public StreamBase {
public:
    FileStream(int fd, std::wstring path, DWORD mode) : fd_(fd), path_(std::move(path)), mode_(mode) {}

    HRESULT STDMETHODCALLTYPE Read(void* buffer, ULONG count, ULONG* read) override {
        if (read)
            *read = 0;
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        if (!CanRead(mode_))
            return STG_E_ACCESSDENIED;
        std::size_t done = 0;
        HRESULT hr = PreadFully(fd_, position_, buffer, count, done);
        return FinishRead(static_cast<ULONG>(done), read, hr);
    }

    HRESULT STDMETHODCALLTYPE Write(const void* buffer, ULONG count, ULONG* written) override {
        if (written)
            *written = 0;
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        // A file created for reading is open for writing underneath, so that it can be truncated.
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        std::size_t done = 0;
        HRESULT hr = PwriteFully(fd_, position_, buffer, count, done);
        position_ += done;
        if (written)
            *written = static_cast<ULONG>(done);
        return hr;
    }

    HRESULT STDMETHODCALLTYPE Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) override {
        ULONGLONG size = 0;
        if (HRESULT hr = Size(size); FAILED(hr))
            return hr;
        ULONGLONG target = 0;
        if (!NewPosition(move, origin, position_, size, target))
            return STG_E_INVALIDFUNCTION;
        position_ = target;
        if (position)
            position->QuadPart = position_;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        if (::ftruncate(fd_, static_cast<off_t>(size.QuadPart)) != 0)
            return StorageError(errno, STG_E_WRITEFAULT);
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        ULONGLONG size = 0;
        if (HRESULT hr = Size(size); FAILED(hr))
            return hr;
        return FillStat(stat, flags, size, path_, mode_);
    }

    // The system's file streams cannot be cloned either.
    HRESULT STDMETHODCALLTYPE Clone(IStream** clone) override {
        if (!clone)
            return STG_E_INVALIDPOINTER;
        *clone = nullptr;
        return E_NOTIMPL;
    }

private:
    ~FileStream() override { ::close(fd_); }

    HRESULT FinishRead(ULONG done, ULONG* read, HRESULT hr) {
        position_ += done;
        if (read)
            *read = done;
        return hr;
    }

    HRESULT Size(ULONGLONG& size) const {
        struct stat info {};
        if (::fstat(fd_, &info) != 0)
            return StorageError(errno, STG_E_READFAULT);
        size = static_cast<ULONGLONG>(info.st_size);
        return S_OK;
    }

    int fd_;
    std::wstring path_;
    DWORD mode_;
    ULONGLONG position_ = 0;
};

int OpenFlags(DWORD mode) {
    int flags = O_CLOEXEC;
    switch (mode & 3) {
    case STGM_WRITE:
        flags |= O_WRONLY;
        break;
    case STGM_READWRITE:
        flags |= O_RDWR;
        break;
    default:
        flags |= O_RDONLY;
        break;
    }
    if (mode & STGM_CREATE)
        flags |= O_CREAT | O_TRUNC;
    return flags;
}

} // namespace
} // namespace ut::platform::posix

namespace ut::platform {

HRESULT OpenFileStream(const wchar_t* path, DWORD mode, IStream** stream) {
    if (HRESULT hr = CheckFileStreamArguments(path, mode, stream); FAILED(hr))
        return hr;
    int flags = posix::OpenFlags(mode);
    if ((mode & STGM_CREATE) && (mode & 3) == STGM_READ)
        flags = (flags & ~O_ACCMODE) | O_RDWR;
    int fd = ::open(posix::SystemPath(path).c_str(), flags, 0666);
    if (fd < 0)
        return posix::StorageError(errno, STG_E_ACCESSDENIED);
    // A folder opens for reading here but not on Windows: refuse it on both homes.
    struct stat info {};
    if (::fstat(fd, &info) == 0 && S_ISDIR(info.st_mode)) {
        ::close(fd);
        return STG_E_ACCESSDENIED;
    }
    *stream = new (std::nothrow) posix::FileStream(fd, path, mode);
    if (!*stream) {
        ::close(fd);
        return E_OUTOFMEMORY;
    }
    return S_OK;
}

} // namespace ut::platform
