// Saving and loading through the library's stream objects, for the persistence tests.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <functional>
#include <vector>

#include <gtest/gtest.h>

#include <ut/persist.h>
#include <ut/platform/stream.h>

#include "support/streams.h"

namespace ut::test {

inline ComPtr<IStream> NewMemoryStream() {
    return StreamOf();
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
