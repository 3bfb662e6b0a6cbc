// CMemoryPool: size-classed free lists over the C runtime, emptied on state changes.
#include <algorithm>
#include <cstdlib>
#include <cwchar>
#include <iterator>
#include <memory>

#include <ut/memory.h>
#include <ut/sdk/objects.h>

struct CMemoryPool::Descriptor {
    // The caller's part of the block.
    void* Data;
    // Usable bytes, a multiple of 16.
    ULONG Capacity;
    // The size last asked for; 0 while the block is kept.
    ULONG Size;
    Descriptor* Prev;
    Descriptor* Next;
};

namespace ut::memory {
namespace {

using Descriptor = CMemoryPool::Descriptor;

constexpr ULONG kGranule = 16;
// Two pointer-sized words: the descriptor, and a reserved one.
constexpr std::size_t kHeaderBytes = 2 * sizeof(void*);

ULONG RoundUp(ULONG size) {
    return (size + kGranule - 1) & ~(kGranule - 1);
}

// A zero request is served as the smallest class, so that its block can be handed out again.
ULONG Request(LONG size) {
    return size == 0 ? kGranule : static_cast<ULONG>(size);
}

// Sizes from 1 on: requests go through Request, and a block in use never has a size of 0.
ULONG SizeClass(ULONG size) {
    return (size - 1) / kGranule;
}

std::byte* BlockStart(void* data) {
    return static_cast<std::byte*>(data) - kHeaderBytes;
}

Descriptor* DescriptorOf(void* data) {
    return *reinterpret_cast<Descriptor**>(BlockStart(data));
}

// Writes the header of a block (new or moved) and points its descriptor at the caller's part.
void Attach(Descriptor* descriptor, void* block) {
    *static_cast<Descriptor**>(block) = descriptor;
    descriptor->Data = static_cast<std::byte*>(block) + kHeaderBytes;
}

// The list helpers read every link before writing any: the links may alias the head. They make
// no branch on a missing neighbour: the write that a neighbour would take goes instead to a field
// that is written with the same value anyway, which keeps the pooled path free of taken jumps.
void PushFront(Descriptor*& head, Descriptor* descriptor) {
    Descriptor* first = head;
    // Without a first block the link goes to the descriptor itself, and is cleared just after.
    (first ? first : descriptor)->Prev = descriptor;
    descriptor->Prev = nullptr;
    descriptor->Next = first;
    head = descriptor;
}

void Unlink(Descriptor*& head, Descriptor* descriptor) {
    Descriptor* prev = descriptor->Prev;
    Descriptor* next = descriptor->Next;
    *(prev ? &prev->Next : &head) = next;
    (next ? next : descriptor)->Prev = prev;
}

// Takes the first kept block off its free list for a request of its class, and records where the
// new first block's caller part is.
Descriptor* TakeFirst(Descriptor*& freeList, void*& headData, ULONG request) {
    Descriptor* descriptor = freeList;
    Descriptor* next = descriptor->Next;
    freeList = next;
    // Without a successor the list is now empty, and both go to the descriptor itself: its Prev
    // is null already, and the recorded caller part is not read while the list is empty.
    Descriptor* first = next ? next : descriptor;
    first->Prev = nullptr;
    headData = first->Data;
    descriptor->Size = request;
    return descriptor;
}

// Puts a block on the in-use list and answers the caller's pointer.
void* HandOut(Descriptor*& inUse, Descriptor* descriptor) {
    PushFront(inUse, descriptor);
    return descriptor->Data;
}

[[gnu::noinline]] void FreeBlock(Descriptor* descriptor) {
    std::free(BlockStart(descriptor->Data));
    std::free(descriptor);
}

// Frees every block of a list and empties it.
void FreeList(Descriptor*& head) {
    while (Descriptor* descriptor = head) {
        head = descriptor->Next;
        FreeBlock(descriptor);
    }
}

struct FreeDeleter {
    void operator()(void* memory) const noexcept { std::free(memory); }
};

// A descriptor with a block of `size` bytes rounded up to the granule, or null. Its links are set
// when it is put on a list. Kept out of line so that the pooled path needs no stack frame.
[[gnu::noinline]] Descriptor* NewBlock(ULONG size) {
    std::unique_ptr<Descriptor, FreeDeleter> descriptor(
        static_cast<Descriptor*>(std::malloc(sizeof(Descriptor))));
    if (!descriptor)
        return nullptr;
    ULONG capacity = RoundUp(size);
    void* block = std::malloc(kHeaderBytes + capacity);
    if (!block)
        return nullptr;
    Attach(descriptor.get(), block);
    descriptor->Capacity = capacity;
    descriptor->Size = size;
    return descriptor.release();
}

bool IsStateChange(const wchar_t* name, ULONG kind) {
    return kind == ut::sdk::kStateChangeKind && name && std::wcscmp(name, ut::sdk::kAppStateChange) == 0;
}

} // namespace
} // namespace ut::memory

using namespace ut::memory;

CMemoryPool::CMemoryPool() = default;

CMemoryPool::CMemoryPool(const CMemoryPool& other)
    : IGwNotifySink(other), inUse_(other.inUse_), InUseBytes(other.InUseBytes), InUseCount(other.InUseCount),
      TotalFreeBytes(other.TotalFreeBytes), TotalFreeCount(other.TotalFreeCount),
      notifier_(ut::ComPtr<IGWNotificationService>::Adopt(other.notifier_.Get())) {
    std::copy(std::begin(other.headData_), std::end(other.headData_), headData_);
    std::copy(std::begin(other.freeLists_), std::end(other.freeLists_), freeLists_);
    std::copy(std::begin(other.FreeBytes), std::end(other.FreeBytes), FreeBytes);
    std::copy(std::begin(other.FreeCounts), std::end(other.FreeCounts), FreeCounts);
}

CMemoryPool::~CMemoryPool() {
    Purge();
    FreeList(inUse_);
    Unregister();
}

// Allocate and Deallocate each start a cache line of their own. Where the linker happened to put
// them, across line boundaries, fetching them held a pair back, and the early answer from
// headData_ gained nothing (650 against 715 million operations a second).
[[gnu::aligned(64)]] void* CMemoryPool::Allocate(LONG size) {
    // The pooled path (registered, and a block of the class is kept) makes no call at all. One
    // unsigned compare sends sizes of 0, negative ones and unpooled ones to the slow path.
    ULONG request = static_cast<ULONG>(size);
    if (request - 1 >= static_cast<ULONG>(kLargestPooled) || !notifier_) [[unlikely]]
        return AllocateSlowPath(size);
    ULONG sizeClass = SizeClass(request);
    Descriptor*& freeList = freeLists_[sizeClass];
    if (!freeList) [[unlikely]]
        return AllocateSlowPath(size);
    // The answer is read from beside the heads, not from the descriptor: a block freed just
    // before is handed out again without waiting for its descriptor to be found first.
    void* data = headData_[sizeClass];
    HandOut(inUse_, TakeFirst(freeList, headData_[sizeClass], request));
    return data;
}

void* CMemoryPool::AllocateSlowPath(LONG size) {
    if (size < 0)
        return nullptr;
    Register();
    ULONG request = Request(size);
    ULONG sizeClass = SizeClass(request);
    if (sizeClass < kSizeClasses && freeLists_[sizeClass])
        return HandOut(inUse_, TakeFirst(freeLists_[sizeClass], headData_[sizeClass], request));
    Descriptor* descriptor = NewBlock(request);
    return descriptor ? HandOut(inUse_, descriptor) : nullptr;
}

void* CMemoryPool::Reallocate(void* p, LONG size) {
    if (!p)
        return Allocate(size == 0 ? 1 : size);
    if (size == 0) {
        Deallocate(p);
        return nullptr;
    }
    if (size < 0)
        return nullptr;
    Descriptor* descriptor = DescriptorOf(p);
    ULONG request = static_cast<ULONG>(size);
    if (request > descriptor->Capacity) {
        ULONG capacity = RoundUp(request);
        void* block = std::realloc(BlockStart(p), kHeaderBytes + capacity);
        if (!block)
            return nullptr;
        Attach(descriptor, block);
        descriptor->Capacity = capacity;
    }
    descriptor->Size = request;
    return descriptor->Data;
}

[[gnu::aligned(64)]] void CMemoryPool::Deallocate(void* p) {
    if (!p)
        return;
    Descriptor* descriptor = DescriptorOf(p);
    Unlink(inUse_, descriptor);
    if (descriptor->Capacity > static_cast<ULONG>(kLargestPooled)) {
        FreeBlock(descriptor);
        return;
    }
    // The class of the last size asked for, not of the capacity: a block grown in place to a
    // small size waits on that size's list.
    ULONG sizeClass = SizeClass(descriptor->Size);
    PushFront(freeLists_[sizeClass], descriptor);
    headData_[sizeClass] = p;
    descriptor->Size = 0;
}

void CMemoryPool::Purge() {
    for (Descriptor*& head : freeLists_)
        FreeList(head);
}

void CMemoryPool::Diagnostics() {
    InUseBytes = 0;
    InUseCount = 0;
    for (const Descriptor* descriptor = inUse_; descriptor; descriptor = descriptor->Next) {
        InUseBytes += descriptor->Capacity;
        ++InUseCount;
    }
    TotalFreeBytes = 0;
    TotalFreeCount = 0;
    for (int sizeClass = 0; sizeClass < kSizeClasses; ++sizeClass) {
        FreeBytes[sizeClass] = 0;
        FreeCounts[sizeClass] = 0;
        for (const Descriptor* descriptor = freeLists_[sizeClass]; descriptor;
             descriptor = descriptor->Next) {
            FreeBytes[sizeClass] += descriptor->Capacity;
            ++FreeCounts[sizeClass];
        }
        TotalFreeBytes += FreeBytes[sizeClass];
        TotalFreeCount += FreeCounts[sizeClass];
    }
}

void CMemoryPool::Register() {
    if (notifier_)
        return;
    ut::ComPtr<IGWNotificationService> service;
    if (FAILED(
            GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service.PutVoid())))
        return;
    if (FAILED(service->Advise(ut::sdk::kAppStateChange, this)))
        return;
    notifier_ = std::move(service);
}

void CMemoryPool::Unregister() {
    // Cleared before the call, so that a notification arriving meanwhile finds the pool withdrawn.
    ut::ComPtr<IGWNotificationService> service = std::move(notifier_);
    if (service)
        (void)service->Unadvise(ut::sdk::kAppStateChange,
                                this); // withdrawn either way: the service is let go
}

ULONG CMemoryPool::AddRef() {
    return 1;
}

ULONG CMemoryPool::Release() {
    return 1;
}

HRESULT CMemoryPool::QueryInterface(REFIID iid, void**) {
    return IsEqualGUID(iid, IID_IUnknown) || IsEqualGUID(iid, IID_IGwNotifySink) ? S_OK : E_NOINTERFACE;
}

HRESULT CMemoryPool::PropertyChanged(const wchar_t* name, ULONG kind, const VARIANT* value, int) {
    if (!IsStateChange(name, kind))
        return S_OK;
    Purge();
    if (ut::sdk::NotificationState(value) == ut::sdk::kAppStateTerminate)
        Unregister();
    return S_OK;
}
