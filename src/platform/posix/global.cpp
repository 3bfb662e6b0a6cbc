// Global memory blocks on POSIX: a table of live blocks, so that every call can tell a handle
// it made from any other value and answer as the system does instead of touching stray memory.
#include <cstdlib>
#include <cstring>
#include <map>
#include <memory>
#include <mutex>
#include <new>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/global.h>

namespace {

struct Block {
    void* data = nullptr;
    SIZE_T size = 0;
    unsigned locks = 0;
    bool fixed = false;
};

struct BlockTable {
    std::mutex mutex;
    // By handle: a fixed block's address, or the address of a movable block's record.
    std::map<HGLOBAL, std::unique_ptr<Block>> blocks;
};

// Never destroyed: blocks may be freed while the process exits.
BlockTable& Blocks() {
    static BlockTable* table = new BlockTable;
    return *table;
}

// The live block behind `handle`, or null with the last error set; the table's lock is held.
Block* Find(BlockTable& table, HGLOBAL handle) {
    auto found = table.blocks.find(handle);
    if (found != table.blocks.end())
        return found->second.get();
    SetLastError(ERROR_INVALID_HANDLE);
    return nullptr;
}

void* Allocate(SIZE_T bytes, UINT flags) {
    // Zero bytes still get an address, so that a block's data is never null.
    SIZE_T size = bytes ? bytes : 1;
    return (flags & GMEM_ZEROINIT) ? std::calloc(size, 1) : std::malloc(size);
}

} // namespace

extern "C" {

HGLOBAL GlobalAlloc(UINT flags, SIZE_T bytes) {
    return ut::ExportBoundary(
        [&]() -> HGLOBAL {
            auto block = std::make_unique<Block>();
            block->data = Allocate(bytes, flags);
            if (!block->data) {
                SetLastError(ERROR_NOT_ENOUGH_MEMORY);
                return nullptr;
            }
            block->size = bytes;
            block->fixed = !(flags & GMEM_MOVEABLE);
            HGLOBAL handle = block->fixed ? block->data : block.get();
            BlockTable& table = Blocks();
            std::lock_guard lock(table.mutex);
            table.blocks.emplace(handle, std::move(block));
            return handle;
        },
        HGLOBAL{nullptr});
}

HGLOBAL GlobalReAlloc(HGLOBAL handle, SIZE_T bytes, UINT flags) {
    BlockTable& table = Blocks();
    std::lock_guard lock(table.mutex);
    Block* block = Find(table, handle);
    if (!block)
        return nullptr;
    void* moved = std::realloc(block->data, bytes ? bytes : 1);
    if (!moved) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    if ((flags & GMEM_ZEROINIT) && bytes > block->size)
        std::memset(static_cast<char*>(moved) + block->size, 0, bytes - block->size);
    block->data = moved;
    block->size = bytes;
    if (!block->fixed || moved == handle)
        return handle;
    // A fixed block's handle is its address, which has moved with it.
    auto node = table.blocks.extract(handle);
    node.key() = moved;
    table.blocks.insert(std::move(node));
    return moved;
}

void* GlobalLock(HGLOBAL handle) {
    BlockTable& table = Blocks();
    std::lock_guard lock(table.mutex);
    Block* block = Find(table, handle);
    if (!block)
        return nullptr;
    if (!block->fixed)
        ++block->locks;
    return block->data;
}

BOOL GlobalUnlock(HGLOBAL handle) {
    BlockTable& table = Blocks();
    std::lock_guard lock(table.mutex);
    Block* block = Find(table, handle);
    if (!block)
        return FALSE;
    if (block->locks == 0) {
        SetLastError(block->fixed ? ERROR_SUCCESS : ERROR_NOT_LOCKED);
        return FALSE;
    }
    if (--block->locks > 0)
        return TRUE;
    SetLastError(ERROR_SUCCESS);
    return FALSE;
}

HGLOBAL GlobalFree(HGLOBAL handle) {
    if (!handle)
        return nullptr;
    BlockTable& table = Blocks();
    std::lock_guard lock(table.mutex);
    Block* block = Find(table, handle);
    if (!block)
        return handle;
    std::free(block->data);
    table.blocks.erase(handle);
    return nullptr;
}

SIZE_T GlobalSize(HGLOBAL handle) {
    BlockTable& table = Blocks();
    std::lock_guard lock(table.mutex);
    Block* block = Find(table, handle);
    return block ? block->size : 0;
}

} // extern "C"
