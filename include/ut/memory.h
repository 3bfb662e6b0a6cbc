// Memory: CMemoryPool, a recycling allocator for many short-lived buffers of varying size.
#pragma once

#include <cstddef>

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/platform/variant.h>
#include <ut/sdk/notify.h>

// Freed blocks of up to 4096 bytes are not returned to the C runtime but kept on one of 256 free
// lists, one per 16-byte size class ((size - 1) / 16), and handed out again to the next request
// of their class without any C-runtime call. Larger blocks go back to the C runtime at once.
// Kept blocks are held until the application announces a change of state ("GWAPP_STATE_CHANGE"
// from the host notification service, which the pool advises itself on at its first Allocate)
// or until Purge.
//
// Each block is one C-runtime allocation that starts with a header of two pointer-sized words:
// the first points to the block's descriptor, the second is reserved and never read. The caller's
// pointer follows the header: 8 bytes in on 32-bit builds, 16 bytes in on 64-bit builds, so that
// the pointer keeps the 16-byte alignment of the C runtime there.
//
// Without a notification service Allocate still works; it then asks the host for the service on
// every call until one is found. Not thread-safe: one pool belongs to one thread.
class UT_API CMemoryPool : public IGwNotifySink {
public:
    static constexpr int kSizeClasses = 256;
    // The largest size that is pooled.
    static constexpr LONG kLargestPooled = 4096;

    // Where a block is, how big it is and which list holds it. Defined by the implementation.
    struct Descriptor;

    CMemoryPool();
    // Frees every block, kept or in use, and withdraws from the notification service.
    ~CMemoryPool();
    // A copy shares the blocks and the service of its original: it takes the list heads, the
    // statistics and the service pointer as they are, without a reference of its own. Only one of
    // the two may then be destroyed (the other is dropped without its destructor): the one that
    // is destroyed frees the shared blocks and gives back the one reference to the service, so
    // the service's count ends where it started. Assignment would orphan the target's own
    // blocks and reference, so a pool cannot be assigned.
    CMemoryPool(const CMemoryPool& other);
    CMemoryPool& operator=(const CMemoryPool&) = delete;

    // A block of at least `size` bytes; a zero size is served as 16. Null for a negative size or
    // when the C runtime has no memory.
    void* Allocate(LONG size);
    // Null `p` allocates (a zero size as 1); a zero size deallocates and answers null. Otherwise
    // grows the block when `size` exceeds its capacity (it never shrinks) and answers where it now
    // is. A negative size, or a failed growth, answers null and leaves the block as it was.
    void* Reallocate(void* p, LONG size);
    // Keeps the block on the free list of the class of the size last asked for it, or frees it
    // when its capacity is above 4096. Null is ignored.
    void Deallocate(void* p);
    // Frees every kept block. Blocks in use are untouched.
    void Purge();
    // Recomputes the statistics below.
    void Diagnostics();
    // Advises the pool on "GWAPP_STATE_CHANGE" when it is not yet; fails quietly without a host.
    void Register();
    // Withdraws the advice and lets the service go.
    void Unregister();

    // Not reference-counted: both answer 1.
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;
    // S_OK for IUnknown and IGwNotifySink, E_NOINTERFACE otherwise. Deliberately stores nothing
    // through `object`: the pool is reached by its own pointer, never through this call.
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override;
    // Kind 1 "GWAPP_STATE_CHANGE" (exact case) purges; a state of 8 (the application terminates)
    // also unregisters. The state is read as ut::sdk::NotificationState reads it. Always S_OK.
    HRESULT STDMETHODCALLTYPE PropertyChanged(const wchar_t* name, ULONG kind, const VARIANT* value,
                                              int reserved) override;

private:
    // Allocate when the pool is not registered or the class has no kept block.
    void* AllocateSlowPath(LONG size);

    Descriptor* freeLists_[kSizeClasses] = {};
    Descriptor* inUse_ = nullptr;

public:
    // Statistics, valid right after Diagnostics: the number and summed capacity of the kept
    // blocks per class and in total, and of the blocks in use.
    std::size_t FreeBytes[kSizeClasses] = {};
    std::size_t InUseBytes = 0;
    std::size_t FreeCounts[kSizeClasses] = {};
    std::size_t InUseCount = 0;
    std::size_t TotalFreeBytes = 0;
    std::size_t TotalFreeCount = 0;

private:
    // The service the pool is advised with, or null.
    ut::ComPtr<IGWNotificationService> notifier_;
    // The caller's part of each free list's first block, where the list is not empty.
    void* headData_[kSizeClasses] = {};
};
