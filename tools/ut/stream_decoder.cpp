// Decodes a persisted stream's chunk tree from its bytes, for `ut stream dump`.
#include "stream_decoder.h"

#include <algorithm>
#include <cstdio>
#include <iterator>

namespace ut::tool {
namespace {

constexpr std::uint32_t kMarkerId = 0x4D414749; // "IGAM"
constexpr std::uint32_t kMarkerVersion = 256;
constexpr std::uint32_t kTableId = 0x43484E4B;    // "KNHC"
constexpr std::uint32_t kFeaturesId = 0x53464541; // "AEFS"
constexpr std::size_t kPlainHeader = 12;          // id, version, size
constexpr std::size_t kMaxRows = 256;             // one index byte
// Bytes of values an object may write before its first child chunk, as far as the search goes.
constexpr std::size_t kMaxLeadingData = 4096;

std::uint32_t Little(const std::uint8_t* at, int bytes) {
    std::uint32_t value = 0;
    for (int i = bytes - 1; i >= 0; --i)
        value = value << 8 | at[i];
    return value;
}

// Reads little-endian values from [pos, end) and never past it.
struct Cursor {
    std::span<const std::uint8_t> bytes;
    std::size_t pos;
    std::size_t end;

    bool Take(int count, std::uint32_t& value) {
        if (end - pos < static_cast<std::size_t>(count))
            return false;
        value = Little(bytes.data() + pos, count);
        pos += static_cast<std::size_t>(count);
        return true;
    }
    // The compact form's packed unsigned integer: a tag whose high nibble gives the form.
    bool Packed(std::uint32_t& value) {
        std::uint32_t tag = 0, low = 0, high = 0;
        if (!Take(1, tag))
            return false;
        std::uint32_t nibble = tag & 15;
        switch (tag & 0xF0) {
        case 0xF0:
            value = nibble;
            return true;
        case 0xE0:
            return Take(1, low) && (value = low << 4 | nibble, true);
        case 0xD0:
            return Take(2, low) && (value = low << 4 | nibble, true);
        case 0xC0:
            return Take(1, low) && Take(2, high) && (value = (high << 8 | low) << 4 | nibble, true);
        case 0xB0:
            return Take(4, value);
        default:
            return false;
        }
    }
};

std::string RowText(const HeaderRow& row) {
    return ChunkIdText(row.id) + "  v" + VersionText(row.version);
}

class Decoder {
public:
    Decoder(std::span<const std::uint8_t> bytes, bool compact)
        : bytes_(bytes), compact_(compact), work_(1'000'000 + 256 * bytes.size()) {}

    // Takes the rows of a table stream; headers then carry only their index.
    bool UseTable(std::span<const std::uint8_t> table) {
        Cursor in{table, 0, table.size()};
        std::uint32_t id = 0, version = 0, size = 0, count = 0;
        if (!in.Take(4, id) || !in.Take(4, version) || !in.Take(4, size) || id != kTableId ||
            !in.Take(4, count) || count > kMaxRows)
            return false;
        for (std::uint32_t k = 0; k < count; ++k) {
            HeaderRow row;
            if (!in.Take(4, row.id) || !in.Take(4, row.version))
                return false;
            rows_.push_back(row);
        }
        // Every row is written, used or not: the unused ones at the end are left out.
        while (!rows_.empty() && !rows_.back().id && !rows_.back().version)
            rows_.pop_back();
        outOfLine_ = true;
        return true;
    }

    const std::vector<HeaderRow>& Rows() const { return rows_; }
    bool OutOfLine() const { return outOfLine_; }

    // The values of [begin, end), then the longest run of whole chunks that ends it exactly.
    void Body(std::size_t begin, std::size_t end, int depth, std::size_t& dataSize,
              std::vector<DecodedChunk>& children) {
        dataSize = end - begin;
        if (depth >= kMaxDepth)
            return;
        std::size_t last = std::min(end - begin, kMaxLeadingData);
        for (std::size_t skip = 0; skip < last && work_ > 0; ++skip) {
            std::vector<DecodedChunk> run;
            if (Chunks(begin + skip, end, depth, run)) {
                dataSize = skip;
                children = std::move(run);
                return;
            }
        }
    }

    // Whether [begin, end) is one or more whole chunks; the header table is as before when not.
    bool Chunks(std::size_t begin, std::size_t end, int depth, std::vector<DecodedChunk>& out) {
        std::size_t rows = rows_.size();
        std::size_t pos = begin;
        while (pos < end) {
            DecodedChunk chunk;
            if (!Chunk(pos, end, depth, chunk)) {
                rows_.resize(rows);
                definedAt_.resize(rows);
                return false;
            }
            out.push_back(std::move(chunk));
        }
        return !out.empty();
    }

    // One chunk at `pos`, which moves past it.
    bool Chunk(std::size_t& pos, std::size_t end, int depth, DecodedChunk& chunk) {
        if (work_ == 0)
            return false;
        --work_;
        Cursor in{bytes_, pos, end};
        chunk.offset = pos;
        if (!Header(in, chunk) || !in.Take(4, chunk.size) || chunk.size > end - in.pos)
            return false;
        // Values of zeros look like empty chunks: inside a body, a chunk needs an id and a version.
        if (depth > 0 && (!chunk.id || !chunk.version))
            return false;
        chunk.body = in.pos;
        pos = in.pos + chunk.size;
        if (!KnownLayout(chunk))
            Body(chunk.body, pos, depth + 1, chunk.dataSize, chunk.children);
        return true;
    }

    // The plain header at the start of a compact stream.
    bool Marker(DecodedChunk& chunk) {
        Cursor in{bytes_, 0, bytes_.size()};
        chunk.header = HeaderForm::Plain;
        return in.Take(4, chunk.id) && in.Take(4, chunk.version) && in.Take(4, chunk.size) &&
               chunk.id == kMarkerId && chunk.version == kMarkerVersion && chunk.size == 0 &&
               (chunk.body = kPlainHeader, chunk.values = {{"form", "compact"}}, true);
    }

private:
    bool Header(Cursor& in, DecodedChunk& chunk) {
        if (!compact_) {
            chunk.header = HeaderForm::Plain;
            return in.Take(4, chunk.id) && in.Take(4, chunk.version);
        }
        std::uint32_t index = 0;
        if (!in.Take(1, index))
            return false;
        chunk.row = static_cast<int>(index);
        // A row defined elsewhere makes this a reference; a new row is defined in the next row's
        // place, as the writer numbers them.
        if (index < rows_.size() && (outOfLine_ || definedAt_[index] != in.pos)) {
            chunk.header = HeaderForm::Reference;
            chunk.id = rows_[index].id;
            chunk.version = rows_[index].version;
            return true;
        }
        if (outOfLine_ || index != rows_.size() || rows_.size() == kMaxRows)
            return false;
        chunk.header = HeaderForm::Definition;
        std::size_t at = in.pos;
        if (!in.Take(4, chunk.id) || !in.Take(4, chunk.version))
            return false;
        rows_.push_back({chunk.id, chunk.version});
        definedAt_.push_back(at);
        return true;
    }

    // The values of the chunks whose layout is known, when the body holds exactly that layout.
    bool KnownLayout(DecodedChunk& chunk) {
        Cursor in{bytes_, chunk.body, chunk.body + chunk.size};
        std::vector<std::pair<std::string, std::string>> values;
        std::uint32_t count = 0;
        if (chunk.id == kTableId && !compact_) {
            if (!in.Take(4, count) || count > kMaxRows)
                return false;
            values.emplace_back("rows", std::to_string(count));
            for (std::uint32_t k = 0; k < count; ++k) {
                HeaderRow row;
                if (!in.Take(4, row.id) || !in.Take(4, row.version))
                    return false;
                if (row.id || row.version)
                    values.emplace_back("row " + std::to_string(k), RowText(row));
            }
        } else if (chunk.id == kFeaturesId) {
            auto next = [&](std::uint32_t& value) { return compact_ ? in.Packed(value) : in.Take(4, value); };
            if (!next(count) || count > chunk.size)
                return false;
            for (std::uint32_t k = 0; k < count; ++k) {
                std::uint32_t feature = 0, version = 0;
                if (!next(feature) || !next(version))
                    return false;
                values.emplace_back("feature " + std::to_string(feature),
                                    "version " + std::to_string(version));
            }
        } else {
            return false;
        }
        if (in.pos != in.end)
            return false;
        chunk.values = std::move(values);
        return true;
    }

    std::span<const std::uint8_t> bytes_;
    bool compact_;
    std::size_t work_; // chunk headers tried; the search for children stops when none are left
    bool outOfLine_ = false;
    std::vector<HeaderRow> rows_;
    std::vector<std::size_t> definedAt_; // where each row's definition ends its index byte
};

// Why the top level is not a run of chunks: the first chunk, walked from the start, that is not one.
std::string WhereItFails(std::span<const std::uint8_t> bytes, std::size_t start, bool compact) {
    std::size_t pos = start;
    Decoder walker(bytes, compact);
    while (pos < bytes.size()) {
        std::size_t at = pos;
        DecodedChunk chunk;
        if (!walker.Chunk(pos, bytes.size(), 0, chunk))
            return "no chunk header fits at byte " + std::to_string(at) + " (" +
                   std::to_string(bytes.size() - at) + " bytes left)";
    }
    return "no chunk found";
}

} // namespace

std::string ChunkIdText(std::uint32_t id) {
    std::string text;
    for (int shift = 0; shift < 32; shift += 8) {
        char c = static_cast<char>(id >> shift & 0xFF);
        if (c < 0x20 || c > 0x7E) {
            char hex[11];
            std::snprintf(hex, sizeof hex, "0x%08X", id);
            return hex;
        }
        text += c;
    }
    return text;
}

std::string VersionText(std::uint32_t version) {
    if (version < 0x10000)
        return std::to_string(version);
    char hex[11];
    std::snprintf(hex, sizeof hex, "0x%08X", version);
    return hex;
}

std::string HexPreview(std::span<const std::uint8_t> bytes, std::size_t count) {
    std::string text;
    for (std::size_t i = 0; i < std::min(count, bytes.size()); ++i) {
        static constexpr char kDigits[] = "0123456789ABCDEF";
        if (i)
            text += ' ';
        text += kDigits[bytes[i] >> 4];
        text += kDigits[bytes[i] & 0xF];
    }
    return bytes.size() > count ? text + " ..." : text;
}

bool DecodeStream(std::span<const std::uint8_t> bytes, std::span<const std::uint8_t> table,
                  DecodedStream& out, std::string& error) {
    out = DecodedStream{};
    out.size = bytes.size();
    DecodedChunk marker;
    out.compact = Decoder(bytes, true).Marker(marker);
    Decoder decoder(bytes, out.compact);
    if (!table.empty() && !decoder.UseTable(table)) {
        error = "the table stream does not hold a header table";
        return false;
    }
    std::size_t start = out.compact ? kPlainHeader : 0;
    if (out.compact)
        out.chunks.push_back(std::move(marker));
    // The top level is chunks from the start: values there would be a guess.
    std::vector<DecodedChunk> chunks;
    bool found = decoder.Chunks(start, bytes.size(), 0, chunks);
    out.table = decoder.Rows();
    out.tableOutOfLine = decoder.OutOfLine();
    std::move(chunks.begin(), chunks.end(), std::back_inserter(out.chunks));
    if (found || (out.compact && start == bytes.size()))
        return true;
    error = WhereItFails(bytes, start, out.compact);
    return false;
}

} // namespace ut::tool
