// Loads arbitrary bytes as a persisted stream: chunks found by peeking, opened, probed, skipped
// or read in part, with the values each chunk's version asks for. Nothing may crash or read
// outside the input, whatever it holds.
//
// Input: one flag byte; with bit 0 set, a 2-byte little-endian length and that many bytes of an
// out-of-line header table; the rest is the stream.
#include <algorithm>
#include <cstdint>

#include <ut/persist.h>
#include <ut/platform/stream.h>
#include <ut/sdk/variant.h>

namespace {

constexpr int kMaxDepth = 12;
constexpr int kMaxChunks = 2000;

ut::ComPtr<IStream> StreamOver(const std::uint8_t* data, std::size_t size) {
    ut::ComPtr<IStream> stream;
    if (FAILED(ut::platform::CreateMemoryStream(stream.Put())))
        return {};
    ULONG written = 0;
    if (size)
        stream->Write(data, static_cast<ULONG>(size), &written);
    LARGE_INTEGER start{};
    stream->Seek(start, STREAM_SEEK_SET, nullptr);
    return stream;
}

// Reads the values that bits 0-9 of `layout` name, in order, until one fails.
void ReadValues(C3DStreamHelper& h, ULONG layout) {
    ULONG u = 0;
    LONG i = 0;
    double d = 0;
    GUID g{};
    if ((layout & 1) && FAILED(h.GetUInt32(u)))
        return;
    if ((layout & 2) && FAILED(h.GetInt32(i)))
        return;
    if ((layout & 4) && FAILED(h.GetDouble(d)))
        return;
    if (layout & 8) {
        CKXString text;
        if (FAILED(h.GetString(text)))
            return;
    }
    if ((layout & 16) && FAILED(h.GetGUID(g)))
        return;
    if (layout & 32) {
        VARIANT value;
        VariantInit(&value);
        HRESULT hr = h.GetVARIANT(&value);
        GWVariantClear(&value);
        if (FAILED(hr))
            return;
    }
    if (layout & 64) {
        SAFEARRAY* array = nullptr;
        if (FAILED(h.GetSAFEARRAY(&array)))
            return;
        SafeArrayDestroy(array);
    }
    if (layout & 128) {
        BYTE bytes[64];
        ULONG count = 0;
        if (FAILED(h.GetUByteArray(bytes, sizeof bytes, &count)))
            return;
    }
    if (layout & 256) {
        char text[32];
        if (FAILED(h.GetAnsiString(text, sizeof text)))
            return;
    }
    if (layout & 512) {
        BSTR text = nullptr;
        if (FAILED(h.GetBSTR(&text)))
            return;
        SysFreeString(text);
    }
}

void Walk(C3DStreamHelper& h, int depth, int& budget) {
    while (budget-- > 0) {
        ULONG id = 0, version = 0;
        if (FAILED(h.ChunkPeekHeader(&id, &version)))
            return;
        HRESULT opened = S_OK;
        switch ((version >> 10) & 3) {
        case 0:
            opened = h.ChunkReadOpen(id, &version);
            break;
        case 1:
            if (FAILED(h.SkipChunk()))
                return;
            continue;
        case 2:
            h.ChunkReadOpen(id ^ 1, &version);
            opened = h.ChunkReadOpen(id, &version);
            break;
        default:
            opened = h.ChunkSafeReadOpen(id, &version);
            break;
        }
        if (FAILED(opened))
            return;
        ReadValues(h, version);
        if (depth < kMaxDepth && !(version & 0x1000))
            Walk(h, depth + 1, budget);
        if (FAILED(h.ChunkReadClose()))
            return;
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size < 1)
        return 0;
    std::uint8_t flags = data[0];
    ++data;
    --size;
    ut::ComPtr<IStream> table;
    if (flags & 1) {
        if (size < 2)
            return 0;
        std::size_t length = std::min<std::size_t>(data[0] | (data[1] << 8), size - 2);
        table = StreamOver(data + 2, length);
        data += 2 + length;
        size -= 2 + length;
    }
    ut::ComPtr<IStream> source = StreamOver(data, size);
    ut::ComPtr<IStream> stream;
    if (!source || FAILED(KXOpenPersistStreamForLoad(source.Get(), table.Get(), stream.Put())))
        return 0;
    C3DStreamHelper helper(stream.Get());
    if (flags & 2)
        ReadValues(helper, 0x3FF);
    int budget = kMaxChunks;
    Walk(helper, 0, budget);
    return 0;
}
