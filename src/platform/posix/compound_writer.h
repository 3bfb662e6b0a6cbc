// Writing compound files on POSIX. A commit builds the new file in a file of its own: a large
// stream's bytes go to the sectors where they stay as soon as they are written, so that a big
// save passes through memory once; the commit then adds the other streams, the mini stream,
// the directory and the tables.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include <ut/platform/storage.h>

namespace ut::platform::posix {

struct Node;

inline constexpr std::uint32_t kSectorSize = 512;

// The sectors of a compound file being written. Sector i lies at 512 * (i + 1), after the
// header. A sector taken new reads as zeros; a sector given back is cleared when taken again.
class SectorFile {
public:
    // `owned`: the descriptor is closed with the file; otherwise its owner keeps it.
    SectorFile(int fd, bool owned) : fd_(fd), owned_(owned) {}
    ~SectorFile() { Retire(); }
    SectorFile(const SectorFile&) = delete;
    SectorFile& operator=(const SectorFile&) = delete;

    static ULONGLONG Offset(std::uint32_t sector) { return (ULONGLONG{sector} + 1) * kSectorSize; }
    int Descriptor() const { return fd_; }
    std::uint32_t Count() const { return count_; }

    HRESULT Take(std::uint32_t& sector);
    void Give(std::uint32_t sector) { free_.push_back(sector); }
    // `count` new sectors one after the other; the first is returned.
    HRESULT Append(std::uint32_t count, std::uint32_t& first);
    // Forgets the sectors appended since `count` was the count, as a failed commit must.
    void Truncate(std::uint32_t count);

    HRESULT Read(ULONGLONG offset, void* buffer, std::size_t count) const;
    HRESULT Write(ULONGLONG offset, const void* data, std::size_t count) const;
    // The file is used up (renamed into place or abandoned): nothing reads or writes it again.
    void Retire();

private:
    int fd_;
    bool owned_;
    std::uint32_t count_ = 0;
    std::vector<std::uint32_t> free_;
    // A failed commit left bytes past the count that truncating could not remove.
    bool clearNew_ = false;
};

// A stream's bytes in the sectors of a SectorFile. Writes that follow each other are gathered
// in memory first, so that a stream written a few bytes at a time does not call the system for
// each; they reach the file when the stretch is full, before a read, and at Flush.
class SectorChain {
public:
    explicit SectorChain(std::shared_ptr<SectorFile> file) : file_(std::move(file)) {}
    ~SectorChain();
    SectorChain(const SectorChain&) = delete;
    SectorChain& operator=(const SectorChain&) = delete;

    ULONGLONG Size() const { return size_; }
    // Reads `count` bytes at `at`, all within the size.
    HRESULT Read(ULONGLONG at, void* buffer, std::size_t count);
    // Writes at `at`; a gap after the end reads as zeros.
    HRESULT Write(ULONGLONG at, const std::uint8_t* data, std::size_t count);
    HRESULT Resize(ULONGLONG size);
    HRESULT Flush();
    // Flushes and gives back the memory of the gathered stretch, as a stream no one holds must:
    // a scene of thousands of streams would otherwise keep a stretch for each.
    HRESULT Release();
    // The sectors that hold the bytes, in order, once flushed.
    const std::vector<std::uint32_t>& Sectors() const { return sectors_; }

private:
    HRESULT Cover(ULONGLONG end);
    HRESULT WriteThrough(ULONGLONG at, const std::uint8_t* data, std::size_t count);
    HRESULT Trim();
    HRESULT Restore();
    template <class Transfer>
    HRESULT ForEachRun(ULONGLONG at, std::size_t count, Transfer&& transfer);

    std::shared_ptr<SectorFile> file_;
    std::vector<std::uint32_t> sectors_;
    ULONGLONG size_ = 0;
    // Bytes written at pendingStart_ and after, not yet in the file.
    std::vector<std::uint8_t> pending_;
    ULONGLONG pendingStart_ = 0;
    // The bytes after the end in its last sector may not be zeros: a Trim failed.
    bool tailDirty_ = false;
};

// Hands a stream's bytes, in order, to `sink`.
using ByteSink = std::function<HRESULT(const std::uint8_t* data, std::size_t count)>;
using ContentReader = std::function<HRESULT(Node& stream, const ByteSink& sink)>;

// Finishes the compound file of the tree under `root` in `file`: streams whose flushed chains
// lie in `file` keep their sectors, `read` gives the bytes of the others. The file's length is
// set last. A failure leaves the chains as they were and the sectors as counted before.
HRESULT WriteCompoundFile(SectorFile& file, Node& root, const ContentReader& read);

} // namespace ut::platform::posix
