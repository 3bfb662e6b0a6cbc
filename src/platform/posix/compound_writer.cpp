// Writing compound files: the sectors of the new file, the chains of large streams in them, and
// the commit that adds the mini stream, the directory, the FAT and the header.
#include "posix/compound_writer.h"

#include <algorithm>
#include <cstring>
#include <unistd.h>

#include <ut/platform/detail/little_endian.h>
#include <ut/platform/text.h>

#include "posix/compound_file.h"
#include "posix/descriptor.h"
#include "posix/storage_document.h"

namespace ut::platform::posix {
namespace {

constexpr std::uint32_t kEntriesPerSector = kSectorSize / 4;
constexpr std::uint32_t kLastRegularSector = 0xFFFFFFFA;
constexpr std::uint32_t kDifatSector = 0xFFFFFFFC;
constexpr std::uint32_t kFatSector = 0xFFFFFFFD;
constexpr std::uint32_t kFreeSector = 0xFFFFFFFF;
// How much of a stream's writes is gathered before it goes to the file.
constexpr std::size_t kGathered = 64 * 1024;
constexpr std::uint8_t kZeros[kSectorSize] = {};

void PutLe16(std::uint8_t* p, std::uint16_t value) {
    WriteLittleEndian(p, value, 2);
}

void PutLe32(std::uint8_t* p, std::uint32_t value) {
    WriteLittleEndian(p, value);
}

void PutTime(std::uint8_t* p, const FILETIME& time) {
    WriteLittleEndian(p, (std::uint64_t{time.dwHighDateTime} << 32) | time.dwLowDateTime, 8);
}

// A table of sector numbers as the file keeps it.
std::vector<std::uint8_t> TableBytes(const std::vector<std::uint32_t>& table) {
    std::vector<std::uint8_t> bytes(table.size() * 4);
    for (std::size_t i = 0; i < table.size(); ++i)
        PutLe32(bytes.data() + 4 * i, table[i]);
    return bytes;
}

// One directory entry of the file being written.
struct Entry {
    Node* node = nullptr;
    std::uint32_t left = kNoEntry;
    std::uint32_t right = kNoEntry;
    std::uint32_t child = kNoEntry;
    bool red = false;
    std::uint32_t start = kEndOfChain;
    std::uint64_t size = 0;
};

// Links `entries[first, last)`, sorted by name, as a balanced red-black tree and returns its
// root. Splitting at the middle leaves every path to a leaf within one level of the others, so
// the tree is valid with the nodes of an incomplete last level red and all others black.
std::uint32_t Balance(std::vector<Entry>& entries, std::uint32_t first, std::uint32_t last, std::size_t level,
                      std::size_t redLevel) {
    if (first >= last)
        return kNoEntry;
    std::uint32_t middle = first + (last - first) / 2;
    entries[middle].red = level == redLevel;
    entries[middle].left = Balance(entries, first, middle, level + 1, redLevel);
    entries[middle].right = Balance(entries, middle + 1, last, level + 1, redLevel);
    return middle;
}

std::uint32_t BalancedTree(std::vector<Entry>& entries, std::uint32_t first, std::uint32_t last) {
    std::size_t count = last - first;
    std::size_t levels = 0;
    while ((std::size_t{1} << levels) - 1 < count)
        ++levels;
    bool complete = count == (std::size_t{1} << levels) - 1;
    return Balance(entries, first, last, 0, complete ? levels : levels - 1);
}

void EncodeEntry(const Entry& entry, bool root, std::uint8_t* raw) {
    const Node& node = *entry.node;
    std::size_t units = WriteUtf16Le(root ? std::wstring(L"Root Entry") : node.name, raw);
    PutLe16(raw + 64, static_cast<std::uint16_t>(2 * units + 2));
    raw[66] = static_cast<std::uint8_t>(root               ? EntryType::Root
                                        : node.IsStorage() ? EntryType::Storage
                                                           : EntryType::Stream);
    raw[67] = entry.red ? 0 : 1;
    PutLe32(raw + 68, entry.left);
    PutLe32(raw + 72, entry.right);
    PutLe32(raw + 76, entry.child);
    std::memcpy(raw + 80, &node.clsid, sizeof(CLSID));
    PutLe32(raw + 96, node.stateBits);
    PutTime(raw + 100, node.created);
    PutTime(raw + 108, node.modified);
    PutLe32(raw + 116, entry.start);
    WriteLittleEndian(raw + 120, entry.size, 8);
}

// Builds one commit's file: what goes where, then the tables that say so.
class ImageWriter {
public:
    ImageWriter(SectorFile& file, const ContentReader& read) : file_(file), read_(read) {}

    HRESULT Write(Node& root) {
        entries_.push_back(Entry{&root});
        PlanStorage(0);
        for (Entry& entry : entries_)
            if (!entry.node->IsStorage() && entry.node != &root)
                if (HRESULT hr = PlaceStream(entry); FAILED(hr))
                    return hr;
        if (HRESULT hr = PlaceMiniStream(entries_[0]); FAILED(hr))
            return hr;
        std::uint32_t miniFat = kEndOfChain;
        if (HRESULT hr = PlaceTable(miniFat_, miniFat); FAILED(hr))
            return hr;
        std::uint32_t directory = kEndOfChain;
        if (HRESULT hr = PlaceDirectory(directory); FAILED(hr))
            return hr;
        return WriteTables(directory, miniFat);
    }

private:
    // A storage's elements take the next entries, in name order, then each storage's own.
    void PlanStorage(std::uint32_t index) {
        Node& storage = *entries_[index].node;
        auto first = static_cast<std::uint32_t>(entries_.size());
        for (const std::shared_ptr<Node>& child : storage.children)
            entries_.push_back(Entry{child.get()});
        auto last = static_cast<std::uint32_t>(entries_.size());
        entries_[index].child = BalancedTree(entries_, first, last);
        for (std::uint32_t element = first; element < last; ++element) {
            if (!entries_[element].node->IsStorage())
                continue;
            entries_[element].start = 0; // a storage has no bytes of its own
            PlanStorage(element);
        }
    }

    HRESULT PlaceStream(Entry& entry) {
        Node& stream = *entry.node;
        entry.size = stream.size;
        if (stream.size == 0)
            return S_OK;
        if (stream.size < kMiniStreamCutoff)
            return PlaceSmall(entry);
        if (stream.chain) {
            if (HRESULT hr = stream.chain->Flush(); FAILED(hr))
                return hr;
            chains_.push_back(&stream.chain->Sectors());
            entry.start = stream.chain->Sectors().front();
            return S_OK;
        }
        auto count = static_cast<std::uint32_t>(SectorsFor(stream.size, kSectorSize));
        if (HRESULT hr = file_.Append(count, entry.start); FAILED(hr))
            return hr;
        runs_.push_back({entry.start, count});
        ULONGLONG at = SectorFile::Offset(entry.start);
        ULONGLONG written = 0;
        HRESULT hr = read_(stream, [&](const std::uint8_t* data, std::size_t size) {
            written += size;
            if (written > stream.size)
                return STG_E_DOCFILECORRUPT;
            HRESULT put = file_.Write(at, data, size);
            at += size;
            return put;
        });
        return FAILED(hr) || written == stream.size ? hr : STG_E_DOCFILECORRUPT;
    }

    HRESULT PlaceSmall(Entry& entry) {
        std::size_t before = mini_.size();
        entry.start = static_cast<std::uint32_t>(before / kMiniSectorSize);
        HRESULT hr = read_(*entry.node, [&](const std::uint8_t* data, std::size_t size) {
            if (mini_.size() - before + size > entry.size)
                return STG_E_DOCFILECORRUPT;
            mini_.insert(mini_.end(), data, data + size);
            return S_OK;
        });
        if (FAILED(hr))
            return hr;
        if (mini_.size() - before != entry.size)
            return STG_E_DOCFILECORRUPT;
        mini_.resize(SectorsFor(mini_.size(), kMiniSectorSize) * kMiniSectorSize);
        auto end = static_cast<std::uint32_t>(mini_.size() / kMiniSectorSize);
        for (std::uint32_t sector = entry.start; sector < end; ++sector)
            miniFat_.push_back(sector + 1 < end ? sector + 1 : kEndOfChain);
        return S_OK;
    }

    // Appends `bytes` in sectors of their own, the last one filled with `fill`.
    HRESULT PlaceBytes(std::vector<std::uint8_t>& bytes, std::uint8_t fill, std::uint32_t& start) {
        if (bytes.empty())
            return S_OK;
        auto count = static_cast<std::uint32_t>(SectorsFor(bytes.size(), kSectorSize));
        bytes.resize(std::size_t{count} * kSectorSize, fill);
        if (HRESULT hr = file_.Append(count, start); FAILED(hr))
            return hr;
        runs_.push_back({start, count});
        return file_.Write(SectorFile::Offset(start), bytes.data(), bytes.size());
    }

    HRESULT PlaceMiniStream(Entry& root) {
        root.size = mini_.size();
        return PlaceBytes(mini_, 0, root.start);
    }

    HRESULT PlaceTable(const std::vector<std::uint32_t>& table, std::uint32_t& start) {
        std::vector<std::uint8_t> bytes = TableBytes(table);
        return PlaceBytes(bytes, 0xFF, start);
    }

    HRESULT PlaceDirectory(std::uint32_t& start) {
        std::size_t perSector = kSectorSize / kDirectoryEntrySize;
        std::vector<std::uint8_t> bytes(SectorsFor(entries_.size(), perSector) * kSectorSize);
        for (std::size_t i = 0; i < bytes.size() / kDirectoryEntrySize; ++i) {
            std::uint8_t* raw = bytes.data() + i * kDirectoryEntrySize;
            if (i < entries_.size()) {
                EncodeEntry(entries_[i], i == 0, raw);
                continue;
            }
            PutLe32(raw + 68, kNoEntry);
            PutLe32(raw + 72, kNoEntry);
            PutLe32(raw + 76, kNoEntry);
        }
        return PlaceBytes(bytes, 0, start);
    }

    // The FAT covers every sector, its own and those of the DIFAT among them.
    HRESULT WriteTables(std::uint32_t directory, std::uint32_t miniFat) {
        std::uint32_t fatCount = 0;
        std::uint32_t difatCount = 0;
        for (;;) {
            std::uint64_t sectors = std::uint64_t{file_.Count()} + fatCount + difatCount;
            auto fat = static_cast<std::uint32_t>(SectorsFor(sectors, kEntriesPerSector));
            auto difat = static_cast<std::uint32_t>(
                fat > kHeaderFatEntries ? SectorsFor(fat - kHeaderFatEntries, kEntriesPerSector - 1) : 0);
            if (fat == fatCount && difat == difatCount)
                break;
            fatCount = fat;
            difatCount = difat;
        }
        std::uint32_t firstFat = 0;
        if (HRESULT hr = file_.Append(fatCount + difatCount, firstFat); FAILED(hr))
            return hr;
        std::vector<std::uint32_t> fat(std::size_t{fatCount} * kEntriesPerSector, kFreeSector);
        for (const std::vector<std::uint32_t>* chain : chains_)
            for (std::size_t i = 0; i < chain->size(); ++i)
                fat[(*chain)[i]] = i + 1 < chain->size() ? (*chain)[i + 1] : kEndOfChain;
        for (auto [first, count] : runs_)
            for (std::uint32_t sector = first; sector < first + count; ++sector)
                fat[sector] = sector + 1 < first + count ? sector + 1 : kEndOfChain;
        std::fill_n(fat.begin() + firstFat, fatCount, kFatSector);
        std::fill_n(fat.begin() + firstFat + fatCount, difatCount, kDifatSector);
        std::vector<std::uint8_t> bytes = TableBytes(fat);
        if (HRESULT hr = file_.Write(SectorFile::Offset(firstFat), bytes.data(), bytes.size()); FAILED(hr))
            return hr;
        if (HRESULT hr = WriteDifat(firstFat, fatCount, difatCount); FAILED(hr))
            return hr;
        return WriteHeader(firstFat, fatCount, difatCount, directory, miniFat);
    }

    // The FAT's sectors past the header's 109, 127 to a sector, each sector naming the next.
    HRESULT WriteDifat(std::uint32_t firstFat, std::uint32_t fatCount, std::uint32_t difatCount) {
        std::uint32_t firstDifat = firstFat + fatCount;
        std::vector<std::uint8_t> bytes(std::size_t{difatCount} * kSectorSize, 0xFF);
        for (std::uint32_t i = kHeaderFatEntries; i < fatCount; ++i) {
            std::uint32_t slot = i - kHeaderFatEntries;
            PutLe32(bytes.data() + (slot / (kEntriesPerSector - 1)) * kSectorSize +
                        (slot % (kEntriesPerSector - 1)) * 4,
                    firstFat + i);
        }
        for (std::uint32_t d = 0; d < difatCount; ++d)
            PutLe32(bytes.data() + d * kSectorSize + kSectorSize - 4,
                    d + 1 < difatCount ? firstDifat + d + 1 : kEndOfChain);
        return bytes.empty() ? S_OK : file_.Write(SectorFile::Offset(firstDifat), bytes.data(), bytes.size());
    }

    HRESULT WriteHeader(std::uint32_t firstFat, std::uint32_t fatCount, std::uint32_t difatCount,
                        std::uint32_t directory, std::uint32_t miniFat) {
        std::uint8_t header[kSectorSize];
        std::memset(header, 0, sizeof header);
        std::memcpy(header, kSignature, sizeof kSignature);
        PutLe16(header + 24, 0x003E);
        PutLe16(header + 26, 3);
        PutLe16(header + 28, 0xFFFE);
        PutLe16(header + 30, 9);
        PutLe16(header + 32, 6);
        PutLe32(header + 44, fatCount);
        PutLe32(header + 48, directory);
        PutLe32(header + 56, kMiniStreamCutoff);
        PutLe32(header + 60, miniFat);
        PutLe32(header + 64, static_cast<std::uint32_t>(SectorsFor(miniFat_.size(), kEntriesPerSector)));
        PutLe32(header + 68, difatCount ? firstFat + fatCount : kEndOfChain);
        PutLe32(header + 72, difatCount);
        for (std::uint32_t i = 0; i < kHeaderFatEntries; ++i)
            PutLe32(header + 76 + 4 * i, i < fatCount ? firstFat + i : kFreeSector);
        if (HRESULT hr = file_.Write(0, header, sizeof header); FAILED(hr))
            return hr;
        if (::ftruncate(file_.Descriptor(), static_cast<off_t>(SectorFile::Offset(file_.Count()))) != 0)
            return StorageError(errno, STG_E_WRITEFAULT);
        return S_OK;
    }

    SectorFile& file_;
    const ContentReader& read_;
    std::vector<Entry> entries_;
    std::vector<std::uint8_t> mini_;
    std::vector<std::uint32_t> miniFat_;
    // The sectors to link: the chains of streams written before the commit, and the runs it
    // appended itself.
    std::vector<const std::vector<std::uint32_t>*> chains_;
    std::vector<std::pair<std::uint32_t, std::uint32_t>> runs_;
};

} // namespace

// --- SectorFile ---------------------------------------------------------------------------------

HRESULT SectorFile::Take(std::uint32_t& sector) {
    bool reused = !free_.empty();
    if (!reused) {
        if (HRESULT hr = Append(1, sector); FAILED(hr))
            return hr;
    } else {
        sector = free_.back();
    }
    if (reused || clearNew_) {
        if (HRESULT hr = Write(Offset(sector), kZeros, kSectorSize); FAILED(hr)) {
            if (!reused)
                --count_;
            return hr;
        }
    }
    if (reused)
        free_.pop_back();
    return S_OK;
}

HRESULT SectorFile::Append(std::uint32_t count, std::uint32_t& first) {
    if (count > kLastRegularSector - count_)
        return STG_E_MEDIUMFULL;
    first = count_;
    count_ += count;
    return S_OK;
}

void SectorFile::Truncate(std::uint32_t count) {
    count_ = count;
    // Past the end the file must read as zeros again, as new sectors are taken uncleared.
    if (fd_ >= 0 && ::ftruncate(fd_, static_cast<off_t>(Offset(count))) != 0)
        clearNew_ = true;
}

HRESULT SectorFile::Read(ULONGLONG offset, void* buffer, std::size_t count) const {
    if (fd_ < 0)
        return STG_E_REVERTED;
    std::size_t done = 0;
    HRESULT hr = PreadFully(fd_, offset, buffer, count, done);
    // Sectors taken but not yet written lie past the end of the file, and read as zeros.
    if (SUCCEEDED(hr))
        std::memset(static_cast<std::uint8_t*>(buffer) + done, 0, count - done);
    return hr;
}

HRESULT SectorFile::Write(ULONGLONG offset, const void* data, std::size_t count) const {
    if (fd_ < 0)
        return STG_E_REVERTED;
    std::size_t done = 0;
    return PwriteFully(fd_, offset, data, count, done);
}

void SectorFile::Retire() {
    if (owned_ && fd_ >= 0)
        ::close(fd_);
    fd_ = -1;
}

// --- SectorChain --------------------------------------------------------------------------------

SectorChain::~SectorChain() {
    for (std::uint32_t sector : sectors_)
        file_->Give(sector);
}

template <class Transfer>
HRESULT SectorChain::ForEachRun(ULONGLONG at, std::size_t count, Transfer&& transfer) {
    for (std::size_t done = 0; done < count;) {
        ULONGLONG position = at + done;
        auto index = static_cast<std::size_t>(position / kSectorSize);
        auto within = static_cast<std::uint32_t>(position % kSectorSize);
        std::size_t run = kSectorSize - within;
        for (std::size_t next = index + 1;
             done + run < count && next < sectors_.size() && sectors_[next] == sectors_[next - 1] + 1; ++next)
            run += kSectorSize;
        run = std::min(run, count - done);
        if (HRESULT hr = transfer(SectorFile::Offset(sectors_[index]) + within, done, run); FAILED(hr))
            return hr;
        done += run;
    }
    return S_OK;
}

HRESULT SectorChain::Cover(ULONGLONG end) {
    auto needed = static_cast<std::size_t>(SectorsFor(end, kSectorSize));
    sectors_.reserve(needed);
    while (sectors_.size() < needed) {
        std::uint32_t sector = 0;
        if (HRESULT hr = file_->Take(sector); FAILED(hr))
            return hr;
        sectors_.push_back(sector);
    }
    return S_OK;
}

HRESULT SectorChain::WriteThrough(ULONGLONG at, const std::uint8_t* data, std::size_t count) {
    if (HRESULT hr = Restore(); FAILED(hr))
        return hr;
    HRESULT hr = Cover(at + count);
    if (SUCCEEDED(hr))
        hr = ForEachRun(at, count, [&](ULONGLONG offset, std::size_t done, std::size_t run) {
            return file_->Write(offset, data + done, run);
        });
    if (SUCCEEDED(hr))
        size_ = std::max(size_, at + count);
    else
        tailDirty_ = FAILED(Trim()); // a part may have gone past the end
    return hr;
}

// Gives back the sectors past the end and clears the rest of the last one, which must read as
// zeros when the stream grows.
HRESULT SectorChain::Trim() {
    auto kept = static_cast<std::size_t>(SectorsFor(size_, kSectorSize));
    while (sectors_.size() > kept) {
        file_->Give(sectors_.back());
        sectors_.pop_back();
    }
    auto within = static_cast<std::uint32_t>(size_ % kSectorSize);
    if (within == 0)
        return S_OK;
    return file_->Write(SectorFile::Offset(sectors_[kept - 1]) + within, kZeros, kSectorSize - within);
}

// Finishes a Trim that failed before the stream grows again.
HRESULT SectorChain::Restore() {
    if (!tailDirty_)
        return S_OK;
    if (HRESULT hr = Trim(); FAILED(hr))
        return hr;
    tailDirty_ = false;
    return S_OK;
}

HRESULT SectorChain::Read(ULONGLONG at, void* buffer, std::size_t count) {
    if (HRESULT hr = Flush(); FAILED(hr))
        return hr;
    return ForEachRun(at, count, [&](ULONGLONG offset, std::size_t done, std::size_t run) {
        return file_->Read(offset, static_cast<std::uint8_t*>(buffer) + done, run);
    });
}

HRESULT SectorChain::Write(ULONGLONG at, const std::uint8_t* data, std::size_t count) {
    if (count == 0)
        return S_OK;
    bool follows = !pending_.empty() && at == pendingStart_ + pending_.size();
    if (!follows || pending_.size() + count > kGathered) {
        if (HRESULT hr = Flush(); FAILED(hr))
            return hr;
        if (count >= kGathered)
            return WriteThrough(at, data, count);
        pending_.reserve(kGathered);
        pendingStart_ = at;
    }
    pending_.insert(pending_.end(), data, data + count);
    size_ = std::max(size_, at + count);
    return S_OK;
}

HRESULT SectorChain::Flush() {
    if (pending_.empty())
        return S_OK;
    if (HRESULT hr = WriteThrough(pendingStart_, pending_.data(), pending_.size()); FAILED(hr))
        return hr;
    pending_.clear();
    return S_OK;
}

HRESULT SectorChain::Release() {
    if (HRESULT hr = Flush(); FAILED(hr))
        return hr;
    pending_.shrink_to_fit();
    return S_OK;
}

HRESULT SectorChain::Resize(ULONGLONG size) {
    if (HRESULT hr = Flush(); FAILED(hr))
        return hr;
    if (size > size_) {
        if (HRESULT hr = Restore(); FAILED(hr))
            return hr;
        if (HRESULT hr = Cover(size); FAILED(hr))
            return hr;
    }
    bool shrinks = size < size_;
    size_ = size;
    if (shrinks && FAILED(Trim()))
        tailDirty_ = true;
    return S_OK;
}

HRESULT WriteCompoundFile(SectorFile& file, Node& root, const ContentReader& read) {
    std::uint32_t mark = file.Count();
    HRESULT hr = ImageWriter(file, read).Write(root);
    if (FAILED(hr))
        file.Truncate(mark);
    return hr;
}

} // namespace ut::platform::posix
