// The chunk tree of a persisted stream, decoded from its bytes alone for `ut stream dump`.
//
// A stream is compact when it opens with the marker chunk ("IGAM", version 256, empty), and plain
// otherwise; its top level is a run of whole chunks. A chunk's body holds values, then nested chunks: the
// values' layout belongs to the object that wrote them, so the decoder takes as children the longest run of
// whole chunks that ends the body exactly, and shows what comes before it as data. The layouts it knows (the
// marker, the header table and the feature versions) it shows as values.
//
// Any input decodes without reading outside it, in bounded time: nesting stops at kMaxDepth and the
// search for children gives up after a fixed amount of work, leaving the rest as data.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <utility>
#include <vector>

namespace ut::tool {

inline constexpr int kMaxDepth = 64;

enum class HeaderForm { Plain, Definition, Reference };

struct HeaderRow {
    std::uint32_t id = 0;
    std::uint32_t version = 0;
};

struct DecodedChunk {
    std::size_t offset = 0; // of the header
    std::uint32_t id = 0;
    std::uint32_t version = 0;
    std::uint32_t size = 0; // of the body
    HeaderForm header = HeaderForm::Plain;
    int row = -1;                                            // the header table's row, compact headers only
    std::size_t body = 0;                                    // offset of the body
    std::size_t dataSize = 0;                                // bytes of values before the children
    std::vector<std::pair<std::string, std::string>> values; // a known layout's values, by name
    std::vector<DecodedChunk> children;
};

struct DecodedStream {
    bool compact = false;
    bool tableOutOfLine = false; // the header table came from a table stream
    std::size_t size = 0;
    std::vector<DecodedChunk> chunks;
    std::vector<HeaderRow> table; // the rows defined, in order
};

// Decodes `bytes`; a table stream's bytes in `table` supply the header table of a stream written
// with its table out of line. False, with `error` saying what and where, when `bytes` is not a
// chunk stream (no chunk at all, or a chunk that runs past the end).
bool DecodeStream(std::span<const std::uint8_t> bytes, std::span<const std::uint8_t> table,
                  DecodedStream& out, std::string& error);

// A chunk id as its four characters in the order they are written, when they are all printable,
// else as eight hex digits ("0x4D414749").
std::string ChunkIdText(std::uint32_t id);

// A version in decimal, or as eight hex digits when it is 0x10000 or more (versions that are texts).
std::string VersionText(std::uint32_t version);

// Up to `count` bytes as two-digit hex numbers separated by spaces, with "..." when there are more.
std::string HexPreview(std::span<const std::uint8_t> bytes, std::size_t count);

} // namespace ut::tool
