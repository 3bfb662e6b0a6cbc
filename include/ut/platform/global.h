// Global memory blocks on both homes (GlobalAlloc and its companions), the handles that data
// transfer and byte arrays in memory pass around, and owners that free or unlock them.
#pragma once

#include <memory>

#include <ut/platform/com.h>
#include <ut/platform/native/global.h>

namespace ut {

struct GlobalDeleter {
    void operator()(HGLOBAL block) const noexcept {
        (void)GlobalFree(block); // a block that cannot be freed is a handle we never owned
    }
};
// Owns a global memory block.
using UniqueGlobal = std::unique_ptr<void, GlobalDeleter>;

// Keeps a global memory block locked for a scope; Data() is null when the lock failed.
class GlobalLockGuard {
public:
    explicit GlobalLockGuard(HGLOBAL block) noexcept : block_(block), data_(GlobalLock(block)) {}
    ~GlobalLockGuard() {
        if (data_)
            (void)GlobalUnlock(block_); // the result only says whether other locks remain
    }
    GlobalLockGuard(const GlobalLockGuard&) = delete;
    GlobalLockGuard& operator=(const GlobalLockGuard&) = delete;

    void* Data() const noexcept { return data_; }

private:
    HGLOBAL block_;
    void* data_;
};

} // namespace ut
