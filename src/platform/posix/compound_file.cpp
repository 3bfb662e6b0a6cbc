// Reading and checking the compound-file layout: header, FAT locations, directory tree, mini FAT.
#include "posix/compound_file.h"

#include <algorithm>
#include <cstring>

#include <ut/platform/text.h>

#include "posix/letters.h"

namespace ut::platform::posix {
namespace {

constexpr std::uint32_t kHeaderSize = 512;
constexpr ULONG kWindowSize = 64 * 1024;

std::uint16_t Le16(const std::uint8_t* p) {
    return static_cast<std::uint16_t>(p[0] | p[1] << 8);
}
std::uint32_t Le32(const std::uint8_t* p) {
    return static_cast<std::uint32_t>(p[0]) | static_cast<std::uint32_t>(p[1]) << 8 |
           static_cast<std::uint32_t>(p[2]) << 16 | static_cast<std::uint32_t>(p[3]) << 24;
}
std::uint64_t Le64(const std::uint8_t* p) {
    return Le32(p) | static_cast<std::uint64_t>(Le32(p + 4)) << 32;
}

// Reads exactly `count` bytes at `offset`; a short read is a damaged file.
HRESULT ReadExactly(ILockBytes* bytes, ULONGLONG offset, void* buffer, ULONG count) {
    ULARGE_INTEGER at{};
    at.QuadPart = offset;
    ULONG read = 0;
    if (HRESULT hr = bytes->ReadAt(at, buffer, count, &read); FAILED(hr))
        return hr;
    return read == count ? S_OK : STG_E_DOCFILECORRUPT;
}

// Decodes an entry's name: UTF-16 units up to the first terminator. False for an empty name or
// a lone surrogate, which no call could name.
bool DecodeName(const std::uint8_t* units, std::uint32_t count, DirectoryEntry& entry) {
    std::uint32_t length = 0;
    while (length < count && Le16(units + 2 * length) != 0)
        ++length;
    if (length == 0)
        return false;
    std::wstring name;
    for (std::uint32_t i = 0; i < length; ++i) {
        std::uint32_t unit = Le16(units + 2 * i);
        if (unit >= 0xD800 && unit <= 0xDBFF && i + 1 < length) {
            std::uint32_t low = Le16(units + 2 * (i + 1));
            if (low >= 0xDC00 && low <= 0xDFFF) {
                std::uint32_t point = 0x10000 + ((unit - 0xD800) << 10) + (low - 0xDC00);
                if constexpr (sizeof(wchar_t) == 2) {
                    name.push_back(static_cast<wchar_t>(unit));
                    name.push_back(static_cast<wchar_t>(low));
                } else {
                    name.push_back(static_cast<wchar_t>(point));
                }
                ++i;
                continue;
            }
        }
        if (unit >= 0xD800 && unit <= 0xDFFF)
            return false;
        name.push_back(static_cast<wchar_t>(unit));
    }
    entry.utf8Name = Utf8FromWide(name);
    entry.key = KeyOf(name);
    entry.name = std::move(name);
    return true;
}

// A chain visits each sector once: one that comes back to a sector is a loop.
bool Repeats(std::vector<std::uint32_t>& sectors) {
    std::sort(sectors.begin(), sectors.end());
    return std::adjacent_find(sectors.begin(), sectors.end()) != sectors.end();
}

wchar_t Upper(wchar_t c) {
    return static_cast<wchar_t>(std::towupper(static_cast<wint_t>(c)));
}

} // namespace

NameKey KeyOf(const std::wstring& name) {
    NameKey key;
    key.units = name.size();
    key.upper.reserve(name.size());
    for (wchar_t c : name) {
        key.units += static_cast<std::uint32_t>(c) > 0xFFFF; // two units in UTF-16
        key.upper.push_back(UpperLetter(c));
    }
    return key;
}

bool NameEqual(const std::wstring& a, const std::wstring& b) {
    return a.size() == b.size() && std::equal(a.begin(), a.end(), b.begin(),
                                              [](wchar_t x, wchar_t y) { return Upper(x) == Upper(y); });
}

struct CompoundFile::Header {
    std::uint8_t bytes[kHeaderSize];
    std::uint16_t MajorVersion() const { return Le16(bytes + 26); }
    std::uint16_t ByteOrder() const { return Le16(bytes + 28); }
    std::uint16_t SectorShift() const { return Le16(bytes + 30); }
    std::uint16_t MiniSectorShift() const { return Le16(bytes + 32); }
    std::uint32_t DirectorySectorCount() const { return Le32(bytes + 40); }
    std::uint32_t FatSectorCount() const { return Le32(bytes + 44); }
    std::uint32_t FirstDirectorySector() const { return Le32(bytes + 48); }
    std::uint32_t MiniStreamCutoff() const { return Le32(bytes + 56); }
    std::uint32_t FirstMiniFatSector() const { return Le32(bytes + 60); }
    std::uint32_t MiniFatSectorCount() const { return Le32(bytes + 64); }
    std::uint32_t FirstDifatSector() const { return Le32(bytes + 68); }
    std::uint32_t DifatSectorCount() const { return Le32(bytes + 72); }
    std::uint32_t HeaderFatSector(std::uint32_t i) const { return Le32(bytes + 76 + 4 * i); }
};

CompoundFile::CompoundFile(ILockBytes* bytes, std::uint32_t maxDepth)
    : bytes_(bytes), maxDepth_(maxDepth), header_(std::make_unique<Header>()) {}
CompoundFile::~CompoundFile() = default;

HRESULT CompoundFile::Open(ILockBytes* bytes, std::uint32_t maxDepth, std::unique_ptr<CompoundFile>& file) {
    file.reset();
    std::unique_ptr<CompoundFile> opened(new CompoundFile(bytes, maxDepth));
    for (HRESULT (CompoundFile::*step)() :
         {&CompoundFile::ReadHeader, &CompoundFile::ReadFatLocations, &CompoundFile::ReadDirectory,
          &CompoundFile::BuildTree, &CompoundFile::ReadMiniFat}) {
        if (HRESULT hr = ((*opened).*step)(); FAILED(hr))
            return hr;
    }
    file = std::move(opened);
    return S_OK;
}

HRESULT CompoundFile::ReadHeader() {
    STATSTG stat{};
    if (HRESULT hr = bytes_->Stat(&stat, STATFLAG_NONAME); FAILED(hr))
        return hr;
    fileSize_ = stat.cbSize.QuadPart;
    if (fileSize_ < kHeaderSize)
        return STG_E_FILEALREADYEXISTS;
    if (HRESULT hr = ReadExactly(bytes_, 0, header_->bytes, kHeaderSize); FAILED(hr))
        return hr;
    if (std::memcmp(header_->bytes, kSignature, sizeof kSignature) != 0)
        return STG_E_FILEALREADYEXISTS;
    const Header& h = *header_;
    std::uint16_t major = h.MajorVersion();
    bool shapeKnown = (major == 3 && h.SectorShift() == 9 && h.DirectorySectorCount() == 0) ||
                      (major == 4 && h.SectorShift() == 12);
    if (!shapeKnown || h.ByteOrder() != 0xFFFE || h.MiniSectorShift() != 6 ||
        h.MiniStreamCutoff() != kMiniStreamCutoff)
        return STG_E_INVALIDHEADER;
    sectorShift_ = h.SectorShift();
    sectorSize_ = 1u << sectorShift_;
    std::uint64_t sectors = fileSize_ > sectorSize_ ? SectorsFor(fileSize_ - sectorSize_, sectorSize_) : 0;
    sectorCount_ = static_cast<std::uint32_t>(std::min<std::uint64_t>(sectors, 0xFFFFFFF0u));
    if (h.FatSectorCount() == 0 || h.FatSectorCount() > sectorCount_)
        return STG_E_DOCFILECORRUPT;
    return S_OK;
}

bool CompoundFile::SectorInFile(std::uint32_t sector) const {
    return sector < sectorCount_;
}

// Tables and the directory are read a sector at a time, through a window of the file.
HRESULT CompoundFile::ReadSector(std::uint32_t sector, std::uint8_t* buffer) {
    if (!SectorInFile(sector))
        return STG_E_DOCFILECORRUPT;
    ULONGLONG offset = (static_cast<ULONGLONG>(sector) + 1) << sectorShift_;
    if (offset < windowStart_ || offset + sectorSize_ > windowStart_ + window_.size()) {
        window_.resize(kWindowSize);
        windowStart_ = offset;
        ULARGE_INTEGER at{};
        at.QuadPart = offset;
        ULONG read = 0;
        HRESULT hr = bytes_->ReadAt(at, window_.data(), kWindowSize, &read);
        window_.resize(SUCCEEDED(hr) ? read : 0);
        if (FAILED(hr))
            return hr;
        if (read < sectorSize_)
            return STG_E_DOCFILECORRUPT;
    }
    std::memcpy(buffer, window_.data() + (offset - windowStart_), sectorSize_);
    return S_OK;
}

HRESULT CompoundFile::ReadFatLocations() {
    const Header& h = *header_;
    std::uint32_t wanted = h.FatSectorCount();
    for (std::uint32_t i = 0; i < kHeaderFatEntries && fatSectors_.size() < wanted; ++i)
        fatSectors_.push_back(h.HeaderFatSector(i));
    std::vector<std::uint8_t> sector(sectorSize_);
    std::uint32_t perSector = sectorSize_ / 4 - 1;
    std::uint32_t next = h.FirstDifatSector();
    for (std::uint32_t k = 0; k < h.DifatSectorCount() && fatSectors_.size() < wanted; ++k) {
        if (HRESULT hr = ReadSector(next, sector.data()); FAILED(hr))
            return hr;
        for (std::uint32_t i = 0; i < perSector && fatSectors_.size() < wanted; ++i)
            fatSectors_.push_back(Le32(sector.data() + 4 * i));
        next = Le32(sector.data() + 4 * perSector);
    }
    if (fatSectors_.size() < wanted)
        return STG_E_DOCFILECORRUPT;
    for (std::uint32_t sector : fatSectors_)
        if (!SectorInFile(sector))
            return STG_E_DOCFILECORRUPT;
    fat_.resize(wanted);
    return S_OK;
}

HRESULT CompoundFile::NextSector(std::uint32_t sector, std::uint32_t& next) {
    std::uint32_t perSector = sectorSize_ / 4;
    std::uint32_t table = sector >> (sectorShift_ - 2);
    if (table >= fat_.size())
        return STG_E_DOCFILECORRUPT;
    if (!fat_[table]) [[unlikely]] {
        std::vector<std::uint8_t> bytes(sectorSize_);
        if (HRESULT hr = ReadSector(fatSectors_[table], bytes.data()); FAILED(hr))
            return hr;
        auto entries = std::make_unique_for_overwrite<std::uint32_t[]>(perSector);
        for (std::uint32_t i = 0; i < perSector; ++i)
            entries[i] = Le32(bytes.data() + 4 * i);
        fat_[table] = std::move(entries);
    }
    next = fat_[table][sector & (perSector - 1)];
    return S_OK;
}

HRESULT CompoundFile::CollectChain(std::uint32_t start, std::vector<std::uint32_t>& sectors) {
    sectors.clear();
    for (std::uint32_t sector = start; sector != kEndOfChain;) {
        if (!SectorInFile(sector) || sectors.size() >= sectorCount_)
            return STG_E_DOCFILECORRUPT;
        sectors.push_back(sector);
        if (HRESULT hr = NextSector(sector, sector); FAILED(hr))
            return hr;
    }
    return S_OK;
}

HRESULT CompoundFile::CheckChain(std::uint32_t start, std::uint64_t bytes) {
    std::uint64_t needed = SectorsFor(bytes, sectorSize_);
    if (needed == 0)
        return S_OK;
    if (needed > sectorCount_)
        return STG_E_DOCFILECORRUPT;
    // Chains written in one go run forward, and a chain that only runs forward has no loop.
    bool forward = true;
    std::uint32_t sector = start;
    for (std::uint64_t k = 1;; ++k) {
        if (!SectorInFile(sector))
            return STG_E_DOCFILECORRUPT;
        if (k == needed)
            break;
        std::uint32_t next = 0;
        if (HRESULT hr = NextSector(sector, next); FAILED(hr))
            return hr;
        forward = forward && next > sector;
        sector = next;
    }
    // The last sector may end the file early, but not before the stream's last byte.
    ULONGLONG end =
        ((static_cast<ULONGLONG>(sector) + 1) << sectorShift_) + (bytes - (needed - 1) * sectorSize_);
    if (end > fileSize_)
        return STG_E_DOCFILECORRUPT;
    return forward ? S_OK : CheckRevisits(start, needed);
}

// Walks a chain that the first walk found whole but not always running forward: it may not
// come back to a sector it has been at.
HRESULT CompoundFile::CheckRevisits(std::uint32_t start, std::uint64_t count) {
    std::vector<std::uint32_t> sectors;
    sectors.reserve(count);
    for (std::uint32_t sector = start; sectors.size() < count;) {
        sectors.push_back(sector);
        if (HRESULT hr = NextSector(sector, sector); FAILED(hr) && sectors.size() < count)
            return hr;
    }
    return Repeats(sectors) ? STG_E_DOCFILECORRUPT : S_OK;
}

HRESULT CompoundFile::ReadDirectory() {
    if (HRESULT hr = CollectChain(header_->FirstDirectorySector(), directorySectors_); FAILED(hr))
        return hr;
    if (directorySectors_.empty())
        return STG_E_DOCFILECORRUPT;
    std::uint32_t perSector = sectorSize_ / kDirectoryEntrySize;
    std::vector<std::uint8_t> sector(sectorSize_);
    entries_.reserve(directorySectors_.size() * perSector);
    bool version3 = header_->MajorVersion() == 3;
    for (std::uint32_t location : directorySectors_) {
        if (HRESULT hr = ReadSector(location, sector.data()); FAILED(hr))
            return hr;
        for (std::uint32_t i = 0; i < perSector; ++i) {
            const std::uint8_t* raw = sector.data() + i * kDirectoryEntrySize;
            DirectoryEntry& entry = entries_.emplace_back();
            entry.type = static_cast<EntryType>(raw[66]);
            if (entry.type == EntryType::Unused)
                continue;
            std::uint16_t nameBytes = Le16(raw + 64);
            if (nameBytes < 2 || nameBytes > 64 || nameBytes % 2 != 0 ||
                !DecodeName(raw, nameBytes / 2 - 1, entry))
                return STG_E_DOCFILECORRUPT;
            entry.left = Le32(raw + 68);
            entry.right = Le32(raw + 72);
            entry.child = Le32(raw + 76);
            std::memcpy(&entry.clsid, raw + 80, sizeof(CLSID));
            entry.stateBits = Le32(raw + 96);
            entry.created = {Le32(raw + 100), Le32(raw + 104)};
            entry.modified = {Le32(raw + 108), Le32(raw + 112)};
            entry.start = Le32(raw + 116);
            // Version 3 files may leave garbage in the upper half of the size.
            entry.size = version3 ? Le32(raw + 120) : Le64(raw + 120);
        }
    }
    // The root has no siblings; libgsf would follow them as if it had.
    const DirectoryEntry& root = entries_[0];
    bool rootAlone = root.left == kNoEntry && root.right == kNoEntry;
    return root.type == EntryType::Root && rootAlone ? S_OK : STG_E_DOCFILECORRUPT;
}

// Walks every storage's tree: each entry is reached once, from one parent, as a stream or a
// storage, within the depth asked for, and no storage holds two elements of one name.
HRESULT CompoundFile::BuildTree() {
    std::uint32_t count = static_cast<std::uint32_t>(entries_.size());
    children_.assign(count, {});
    checked_.assign(count, false);
    std::vector<bool> reached(count, false);
    reached[0] = true;
    struct Visit {
        std::uint32_t entry;
        std::uint32_t parent;
        std::uint32_t depth;
    };
    std::vector<Visit> pending;
    if (entries_[0].child != kNoEntry)
        pending.push_back({entries_[0].child, 0, 1});
    while (!pending.empty()) {
        Visit visit = pending.back();
        pending.pop_back();
        if (visit.entry >= count || reached[visit.entry] || visit.depth > maxDepth_)
            return STG_E_DOCFILECORRUPT;
        reached[visit.entry] = true;
        const DirectoryEntry& entry = entries_[visit.entry];
        if (entry.type != EntryType::Storage && entry.type != EntryType::Stream)
            return STG_E_DOCFILECORRUPT;
        children_[visit.parent].push_back(visit.entry);
        for (std::uint32_t sibling : {entry.left, entry.right})
            if (sibling != kNoEntry)
                pending.push_back({sibling, visit.parent, visit.depth + 1});
        if (entry.type == EntryType::Storage && entry.child != kNoEntry)
            pending.push_back({entry.child, visit.entry, visit.depth + 1});
        if (entry.type == EntryType::Stream && entry.child != kNoEntry)
            return STG_E_DOCFILECORRUPT;
    }
    for (std::vector<std::uint32_t>& elements : children_) {
        std::sort(elements.begin(), elements.end(),
                  [&](std::uint32_t a, std::uint32_t b) { return entries_[a].key < entries_[b].key; });
        for (std::size_t i = 1; i < elements.size(); ++i)
            if (entries_[elements[i - 1]].key == entries_[elements[i]].key)
                return STG_E_DOCFILECORRUPT;
    }
    return S_OK;
}

HRESULT CompoundFile::ReadMiniFat() {
    const DirectoryEntry& root = entries_[0];
    if (root.size == 0)
        return S_OK;
    if (HRESULT hr = CheckChain(root.start, root.size); FAILED(hr))
        return hr;
    std::vector<std::uint32_t> sectors;
    if (HRESULT hr = CollectChain(header_->FirstMiniFatSector(), sectors); FAILED(hr))
        return hr;
    std::vector<std::uint8_t> bytes(sectorSize_);
    for (std::uint32_t location : sectors) {
        if (HRESULT hr = ReadSector(location, bytes.data()); FAILED(hr))
            return hr;
        for (std::uint32_t i = 0; i < sectorSize_ / 4; ++i)
            miniFat_.push_back(Le32(bytes.data() + 4 * i));
    }
    return S_OK;
}

HRESULT CompoundFile::CheckMiniChain(std::uint32_t start, std::uint64_t bytes) {
    std::uint64_t container = entries_[0].size;
    std::uint64_t needed = SectorsFor(bytes, kMiniSectorSize);
    std::vector<std::uint32_t> sectors;
    sectors.reserve(needed);
    for (std::uint32_t sector = start; sectors.size() < needed; sector = miniFat_[sector]) {
        std::uint64_t used =
            std::min<std::uint64_t>(kMiniSectorSize, bytes - sectors.size() * kMiniSectorSize);
        if (sector >= miniFat_.size() ||
            static_cast<std::uint64_t>(sector) * kMiniSectorSize + used > container)
            return STG_E_DOCFILECORRUPT;
        sectors.push_back(sector);
    }
    return Repeats(sectors) ? STG_E_DOCFILECORRUPT : S_OK;
}

HRESULT CompoundFile::CheckStream(std::uint32_t index) {
    const DirectoryEntry& entry = entries_[index];
    if (entry.size == 0 || checked_[index])
        return S_OK;
    HRESULT hr = entry.size < kMiniStreamCutoff ? CheckMiniChain(entry.start, entry.size)
                                                : CheckChain(entry.start, entry.size);
    checked_[index] = SUCCEEDED(hr);
    return hr;
}

std::uint32_t CompoundFile::Find(std::uint32_t parent, const NameKey& key) const {
    const std::vector<std::uint32_t>& elements = children_[parent];
    auto found = std::lower_bound(
        elements.begin(), elements.end(), key,
        [&](std::uint32_t element, const NameKey& wanted) { return entries_[element].key < wanted; });
    return found != elements.end() && entries_[*found].key == key ? *found : kNoEntry;
}

ULONGLONG CompoundFile::EntryOffset(std::uint32_t index) const {
    std::uint32_t perSector = sectorSize_ / kDirectoryEntrySize;
    std::uint32_t sector = directorySectors_[index / perSector];
    return ((static_cast<ULONGLONG>(sector) + 1) << sectorShift_) + (index % perSector) * kDirectoryEntrySize;
}

} // namespace ut::platform::posix
