// The compound-file layout as the POSIX storage sees it: the header, the sector tables and the
// directory, checked before libgsf reads them, so that a damaged file is refused with the
// system's error code instead of being misread, and so that the directory's class ids, state
// bits and times (which libgsf does not show) can be read and written.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <ut/platform/storage.h>

namespace ut::platform::posix {

inline constexpr std::uint8_t kSignature[8] = {0xD0, 0xCF, 0x11, 0xE0, 0xA1, 0xB1, 0x1A, 0xE1};
inline constexpr std::uint32_t kNoEntry = 0xFFFFFFFF;
inline constexpr std::uint32_t kDirectoryEntrySize = 128;
// The FAT sectors the header names itself; the DIFAT names the rest.
inline constexpr std::uint32_t kHeaderFatEntries = 109;
inline constexpr std::uint32_t kEndOfChain = 0xFFFFFFFE;
// Streams shorter than this live in the mini stream, in 64-byte sectors.
inline constexpr std::uint64_t kMiniStreamCutoff = 4096;
inline constexpr std::uint32_t kMiniSectorSize = 64;
// libgsf follows the directory tree recursively, with about 250 bytes of stack a level: deeper
// trees are refused rather than let it overflow a thread's stack.
inline constexpr std::uint32_t kMaxTreeDepth = 4096;

// How many sectors of `size` bytes hold `bytes`.
constexpr std::uint64_t SectorsFor(std::uint64_t bytes, std::uint64_t size) {
    return (bytes + size - 1) / size;
}

enum class EntryType : std::uint8_t { Unused = 0, Storage = 1, Stream = 2, Root = 5 };

// The form in which element names compare, as the format orders them: by length in UTF-16
// units, then by upper-case letters.
struct NameKey {
    std::size_t units = 0;
    std::wstring upper;
    auto operator<=>(const NameKey&) const = default;
};
NameKey KeyOf(const std::wstring& name);

struct DirectoryEntry {
    std::wstring name;
    NameKey key;
    // The name as libgsf reports it, by which it finds the element.
    std::string utf8Name;
    EntryType type = EntryType::Unused;
    std::uint32_t left = kNoEntry;
    std::uint32_t right = kNoEntry;
    std::uint32_t child = kNoEntry;
    CLSID clsid{};
    std::uint32_t stateBits = 0;
    FILETIME created{};
    FILETIME modified{};
    std::uint32_t start = 0;
    std::uint64_t size = 0;
};

bool NameEqual(const std::wstring& a, const std::wstring& b);

class CompoundFile {
public:
    // Reads and checks the header, the table locations, the directory and the mini stream.
    // STG_E_FILEALREADYEXISTS when the bytes are not a compound file, STG_E_INVALIDHEADER when
    // the header is damaged, STG_E_DOCFILECORRUPT when a table or the directory is.
    // `maxDepth` bounds the directory tree's depth (its links followed one after the other).
    static HRESULT Open(ILockBytes* bytes, std::uint32_t maxDepth, std::unique_ptr<CompoundFile>& file);

    const DirectoryEntry& Entry(std::uint32_t index) const { return entries_[index]; }
    // The elements of a storage (or of the root), in the order of its directory tree.
    const std::vector<std::uint32_t>& Children(std::uint32_t index) const { return children_[index]; }
    // The element of the storage `parent` whose name has `key`, or kNoEntry.
    std::uint32_t Find(std::uint32_t parent, const NameKey& key) const;
    // Checks that the sector chain of a stream holds all of its bytes.
    HRESULT CheckStream(std::uint32_t index);
    // Where a directory entry lies in the bytes.
    ULONGLONG EntryOffset(std::uint32_t index) const;
    std::uint32_t EntryCount() const { return static_cast<std::uint32_t>(entries_.size()); }
    std::uint32_t SectorSize() const { return sectorSize_; }

    CompoundFile(const CompoundFile&) = delete;
    CompoundFile& operator=(const CompoundFile&) = delete;
    ~CompoundFile();

private:
    struct Header;
    CompoundFile(ILockBytes* bytes, std::uint32_t maxDepth);

    HRESULT ReadHeader();
    HRESULT ReadFatLocations();
    HRESULT ReadDirectory();
    HRESULT BuildTree();
    HRESULT ReadMiniFat();
    HRESULT ReadSector(std::uint32_t sector, std::uint8_t* buffer);
    HRESULT NextSector(std::uint32_t sector, std::uint32_t& next);
    // Walks a chain of `bytes` bytes from `start`; each sector must lie in the file.
    HRESULT CheckChain(std::uint32_t start, std::uint64_t bytes);
    HRESULT CheckRevisits(std::uint32_t start, std::uint64_t count);
    HRESULT CheckMiniChain(std::uint32_t start, std::uint64_t bytes);
    // Collects a chain whose length the header does not give, refusing a cycle.
    HRESULT CollectChain(std::uint32_t start, std::vector<std::uint32_t>& sectors);
    bool SectorInFile(std::uint32_t sector) const;

    // The document that opened the layout keeps the bytes.
    ILockBytes* bytes_;
    std::uint32_t maxDepth_;
    ULONGLONG fileSize_ = 0;
    std::uint32_t sectorShift_ = 9;
    std::uint32_t sectorSize_ = 512;
    std::uint32_t sectorCount_ = 0;
    std::unique_ptr<Header> header_;
    std::vector<std::uint32_t> fatSectors_;
    // The FAT, read one sector at a time as chains need it: opening a large file to read one
    // stream reads and keeps only the sectors of that stream's chain.
    std::vector<std::unique_ptr<std::uint32_t[]>> fat_;
    std::vector<std::uint32_t> miniFat_;
    std::vector<std::uint32_t> directorySectors_;
    std::vector<DirectoryEntry> entries_;
    std::vector<std::vector<std::uint32_t>> children_;
    // The streams whose chains have been checked whole.
    std::vector<bool> checked_;
    std::vector<std::uint8_t> window_;
    ULONGLONG windowStart_ = 0;
};

} // namespace ut::platform::posix
