// Saving and loading through the library's stream objects, for the persistence tests.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <functional>
#include <vector>

#include <gtest/gtest.h>

#include <ut/persist.h>
#include <ut/platform/stream.h>

namespace ut::test {

using Bytes = std::vector<std::uint8_t>;

inline ComPtr<IStream> NewMemoryStream() {
    ComPtr<IStream> stream;
    EXPECT_EQ(ut::platform::CreateMemoryStream(stream.Put()), S_OK);
    return stream;
}

inline ComPtr<IStream> StreamOf(const Bytes& bytes) {
    ComPtr<IStream> stream = NewMemoryStream();
    ULONG written = 0;
    if (!bytes.empty()) {
        EXPECT_EQ(stream->Write(bytes.data(), static_cast<ULONG>(bytes.size()), &written), S_OK);
    }
    LARGE_INTEGER start{};
    stream->Seek(start, STREAM_SEEK_SET, nullptr);
    return stream;
}

// The whole content of a stream; its position is left as it was.
inline Bytes BytesOf(IStream* stream) {
    LARGE_INTEGER zero{};
    ULARGE_INTEGER position{};
    stream->Seek(zero, STREAM_SEEK_CUR, &position);
    stream->Seek(zero, STREAM_SEEK_SET, nullptr);
    Bytes bytes;
    std::uint8_t chunk[4096];
    ULONG got = 0;
    while (SUCCEEDED(stream->Read(chunk, sizeof chunk, &got)) && got > 0)
        bytes.insert(bytes.end(), chunk, chunk + got);
    LARGE_INTEGER back{};
    back.QuadPart = static_cast<LONGLONG>(position.QuadPart);
    stream->Seek(back, STREAM_SEEK_SET, nullptr);
    return bytes;
}

// The 12 bytes of the marker chunk that opens every compact stream.
inline const Bytes kMarker = {0x49, 0x47, 0x41, 0x4D, 0x00, 0x01, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00};

inline Bytes Concat(Bytes a, const Bytes& b) {
    a.insert(a.end(), b.begin(), b.end());
    return a;
}

enum class Form { Plain, Compact, CompactTable };

struct Saved {
    Bytes data;
    Bytes table;
};

// Runs `write` over a helper on a new stream of the given form and returns what it wrote.
// Plain streams are written through a helper over the bare stream, as older savers did.
inline Saved Save(Form form, const std::function<void(C3DStreamHelper&)>& write) {
    ComPtr<IStream> data = NewMemoryStream();
    ComPtr<IStream> table = form == Form::CompactTable ? NewMemoryStream() : ComPtr<IStream>();
    if (form == Form::Plain) {
        C3DStreamHelper helper(data.Get());
        write(helper);
    } else {
        ComPtr<IStream> stream;
        EXPECT_EQ(KXOpenPersistStreamForSave(data.Get(), table.Get(), stream.Put()), S_OK);
        {
            C3DStreamHelper helper(stream.Get());
            write(helper);
        }
        EXPECT_EQ(KXClosePersistStream(stream.Get()), S_OK);
    }
    return {BytesOf(data.Get()), table ? BytesOf(table.Get()) : Bytes()};
}

// Runs `read` over a helper on a stream object opened for loading `saved`.
inline void Load(const Saved& saved, const std::function<void(C3DStreamHelper&)>& read) {
    ComPtr<IStream> data = StreamOf(saved.data);
    ComPtr<IStream> table = saved.table.empty() ? ComPtr<IStream>() : StreamOf(saved.table);
    ComPtr<IStream> stream;
    ASSERT_EQ(KXOpenPersistStreamForLoad(data.Get(), table.Get(), stream.Put()), S_OK);
    C3DStreamHelper helper(stream.Get());
    read(helper);
}

// True when this process was started with compression switched off.
inline bool CompressionDisabled() {
    return std::getenv("KX_DISABLE_STREAM_COMPRESSION") != nullptr;
}

} // namespace ut::test
