// The value operations of the library's own compressor, inline, so that a C3DStreamHelper whose
// stream carries that compressor calls them without a virtual call per value.
#pragma once

#include <ut/persist.h>
#include <ut/sdk/detail/stream_buffer.h>

#include "persist/packing.h"

namespace ut::persist {

// {5C2E8B17-3F4A-4D69-B0C1-7E9A2D6F4B38}: answered by the library's own stream objects with
// their compressor, whose value operations are C3DStreamCompressor's as they stand. Private to
// the library: a compressor of another kind (or one that overrides them) never answers it.
inline constexpr IID IID_StockCompressor = {
    0x5C2E8B17, 0x3F4A, 0x4D69, {0xB0, 0xC1, 0x7E, 0x9A, 0x2D, 0x6F, 0x4B, 0x38}};

namespace codec {

// Encoders write straight into the window when it has room at its end, and decoders read
// straight from it when it holds a whole form; otherwise the bytes go through a local copy and
// the same code, out of line, so that the direct path needs no stack frame.
template <class T>
[[gnu::noinline]] HRESULT WritePackedCopied(ut::sdk::StreamBuffer& buffer, ULONG (*pack)(T, BYTE*), T value) {
    BYTE bytes[kMaxPacked];
    return buffer.Write(bytes, pack(value, bytes));
}

template <class T>
HRESULT WritePacked(ut::sdk::StreamBuffer& buffer, ULONG (*pack)(T, BYTE*), T value) {
    BYTE* room = buffer.Reserve(kMaxPacked);
    if (!room) [[unlikely]]
        return WritePackedCopied(buffer, pack, value);
    buffer.Commit(pack(value, room));
    return S_OK;
}

[[gnu::noinline]] inline HRESULT ReadPackedIntegerCopied(ut::sdk::StreamBuffer& buffer, BYTE lowestTag,
                                                         ULONG& value) {
    BYTE bytes[kDecodeWindow] = {};
    (void)buffer.ReadValue(bytes[0]); // a missing tag stays 0, which no form has
    if (bytes[0] < lowestTag)
        return E_FAIL;
    if (HRESULT hr = buffer.Read(bytes + 1, PayloadBytes(bytes[0])); FAILED(hr))
        return hr;
    UnpackInteger(bytes, value);
    return S_OK;
}

// Decodes one integer form whose tag is at least `lowestTag`.
inline HRESULT ReadPackedInteger(ut::sdk::StreamBuffer& buffer, BYTE lowestTag, ULONG& value) {
    if (!buffer.Holds(kDecodeWindow)) [[unlikely]]
        return ReadPackedIntegerCopied(buffer, lowestTag, value);
    const BYTE* bytes = buffer.Cursor();
    if (bytes[0] < lowestTag) [[unlikely]] {
        buffer.Advance(1);
        return E_FAIL;
    }
    buffer.Advance(UnpackInteger(bytes, value));
    return S_OK;
}

[[gnu::noinline]] inline HRESULT ReadPackedDoubleCopied(ut::sdk::StreamBuffer& buffer, double& value) {
    BYTE bytes[kDecodeWindow] = {};
    (void)buffer.ReadValue(bytes[0]); // as above
    double probe = 0;
    ULONG length = UnpackDouble(bytes, probe);
    if (!length)
        return E_FAIL;
    if (HRESULT hr = buffer.Read(bytes + 1, length - 1); FAILED(hr))
        return hr;
    UnpackDouble(bytes, value);
    return S_OK;
}

inline HRESULT ReadPackedDouble(ut::sdk::StreamBuffer& buffer, double& value) {
    if (!buffer.Holds(kDecodeWindow)) [[unlikely]]
        return ReadPackedDoubleCopied(buffer, value);
    ULONG length = UnpackDouble(buffer.Cursor(), value);
    if (length == 0) [[unlikely]] {
        buffer.Advance(1);
        return E_FAIL;
    }
    buffer.Advance(length); // a branch, not a select: keeps the position's chain short
    return S_OK;
}

} // namespace codec

// The bodies of C3DStreamCompressor's value operations; the compressor's own methods are these.
struct StockCodec {
    static HRESULT SaveUInt32(C3DStreamCompressor& c, ULONG value) {
        if (!c.buffer_)
            return E_UNEXPECTED;
        if (!c.Packing(c.packUInt32_))
            return c.buffer_->WriteValue(value);
        return codec::WritePacked(*c.buffer_, &PackUInt32, value);
    }

    static HRESULT LoadUInt32(C3DStreamCompressor& c, ULONG& value) {
        value = 0;
        if (!c.buffer_)
            return E_UNEXPECTED;
        if (!c.Packing(c.packUInt32_))
            return c.buffer_->ReadValue(value);
        return codec::ReadPackedInteger(*c.buffer_, kTagWhole, value);
    }

    static HRESULT SaveInt32(C3DStreamCompressor& c, LONG value) {
        if (!c.buffer_)
            return E_UNEXPECTED;
        if (!c.Packing(c.packInt32_))
            return c.buffer_->WriteValue(value);
        return codec::WritePacked(*c.buffer_, &PackInt32, value);
    }

    static HRESULT LoadInt32(C3DStreamCompressor& c, LONG& value) {
        value = 0;
        if (!c.buffer_)
            return E_UNEXPECTED;
        if (!c.Packing(c.packInt32_))
            return c.buffer_->ReadValue(value);
        ULONG bits = 0;
        HRESULT hr = codec::ReadPackedInteger(*c.buffer_, kTagNegWhole, bits);
        value = static_cast<LONG>(bits);
        return hr;
    }

    static HRESULT SaveDouble(C3DStreamCompressor& c, double value) {
        if (!c.buffer_)
            return E_UNEXPECTED;
        if (!c.Packing(c.packDouble_))
            return c.buffer_->WriteValue(value);
        return codec::WritePacked(*c.buffer_, &PackDouble, value);
    }

    static HRESULT LoadDouble(C3DStreamCompressor& c, double& value) {
        if (!c.buffer_)
            return E_UNEXPECTED;
        if (!c.Packing(c.packDouble_))
            return c.buffer_->ReadValue(value);
        return codec::ReadPackedDouble(*c.buffer_, value);
    }
};

} // namespace ut::persist
