// Memory streams for tests: made with a given content, and read back whole.
#pragma once

#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/stream.h>

namespace ut::test {

using Bytes = std::vector<std::uint8_t>;

// A memory stream holding `content`, positioned at its start.
inline ComPtr<IStream> StreamOf(const Bytes& content = {}) {
    ComPtr<IStream> stream;
    EXPECT_EQ(ut::platform::CreateMemoryStream(stream.Put()), S_OK);
    if (!content.empty()) {
        ULONG written = 0;
        EXPECT_EQ(stream->Write(content.data(), static_cast<ULONG>(content.size()), &written), S_OK);
        LARGE_INTEGER start{};
        stream->Seek(start, STREAM_SEEK_SET, nullptr);
    }
    return stream;
}

inline ULONGLONG PositionOf(IStream* stream) {
    LARGE_INTEGER zero{};
    ULARGE_INTEGER position{};
    stream->Seek(zero, STREAM_SEEK_CUR, &position);
    return position.QuadPart;
}

// The whole content of a stream; its position is left as it was.
inline Bytes BytesOf(IStream* stream) {
    ULONGLONG position = PositionOf(stream);
    LARGE_INTEGER offset{};
    stream->Seek(offset, STREAM_SEEK_SET, nullptr);
    Bytes bytes;
    std::uint8_t chunk[4096];
    ULONG got = 0;
    while (SUCCEEDED(stream->Read(chunk, sizeof chunk, &got)) && got > 0)
        bytes.insert(bytes.end(), chunk, chunk + got);
    offset.QuadPart = static_cast<LONGLONG>(position);
    stream->Seek(offset, STREAM_SEEK_SET, nullptr);
    return bytes;
}

} // namespace ut::test
