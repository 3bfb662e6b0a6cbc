// Decodes arbitrary bytes as a persisted stream, as `ut stream dump` does, the first bytes also as
// a table stream. Nothing may crash, hang or read outside the input, and every chunk, run of data
// and header row the decoder reports must lie within the input and within its parent.
#include <cstdint>
#include <cstdlib>
#include <span>
#include <string>

#include "../tools/ut/stream_decoder.h"

namespace {

void Check(bool holds) {
    if (!holds)
        std::abort();
}

void CheckChunks(const std::vector<ut::tool::DecodedChunk>& chunks, std::size_t begin, std::size_t end,
                 std::span<const std::uint8_t> bytes, int depth) {
    Check(depth <= ut::tool::kMaxDepth + 1);
    for (const ut::tool::DecodedChunk& chunk : chunks) {
        Check(chunk.offset >= begin && chunk.body >= chunk.offset && chunk.body + chunk.size <= end);
        Check(chunk.dataSize <= chunk.size && chunk.row < 256);
        (void)ut::tool::HexPreview(bytes.subspan(chunk.body, chunk.dataSize), 16);
        (void)ut::tool::ChunkIdText(chunk.id);
        CheckChunks(chunk.children, chunk.body + chunk.dataSize, chunk.body + chunk.size, bytes, depth + 1);
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::span<const std::uint8_t> bytes(data, size);
    for (std::size_t split : {std::size_t{0}, size / 2}) {
        ut::tool::DecodedStream stream;
        std::string error;
        bool decoded = ut::tool::DecodeStream(bytes.subspan(split), bytes.first(split), stream, error);
        Check(decoded ? error.empty() : !error.empty());
        if (!decoded)
            continue;
        Check(stream.size == size - split && stream.table.size() <= 256);
        CheckChunks(stream.chunks, 0, stream.size, bytes.subspan(split), 0);
    }
    return 0;
}
