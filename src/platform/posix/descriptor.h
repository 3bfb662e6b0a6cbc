// Reading and writing a file descriptor at an offset, whole: interrupted and short transfers
// go on where they stopped. The descriptor's own offset is never used.
#pragma once

#include <cerrno>
#include <cstddef>
#include <unistd.h>

#include "posix/path.h"

namespace ut::platform::posix {

// Reads up to `count` bytes at `offset`, stopping early only at the end of the file. `done`
// counts what was read, also when a failure stops it.
inline HRESULT PreadFully(int fd, ULONGLONG offset, void* buffer, std::size_t count, std::size_t& done) {
    done = 0;
    while (done < count) {
        ssize_t got =
            ::pread(fd, static_cast<char*>(buffer) + done, count - done, static_cast<off_t>(offset + done));
        if (got < 0 && errno == EINTR)
            continue;
        if (got < 0)
            return StorageError(errno, STG_E_READFAULT);
        if (got == 0)
            break;
        done += static_cast<std::size_t>(got);
    }
    return S_OK;
}

// Writes all `count` bytes at `offset`; `done` counts what was written, also on failure.
inline HRESULT PwriteFully(int fd, ULONGLONG offset, const void* buffer, std::size_t count,
                           std::size_t& done) {
    done = 0;
    while (done < count) {
        ssize_t put = ::pwrite(fd, static_cast<const char*>(buffer) + done, count - done,
                               static_cast<off_t>(offset + done));
        if (put < 0 && errno == EINTR)
            continue;
        if (put < 0)
            return StorageError(errno, STG_E_WRITEFAULT);
        if (put == 0)
            return STG_E_WRITEFAULT;
        done += static_cast<std::size_t>(put);
    }
    return S_OK;
}

} // namespace ut::platform::posix
