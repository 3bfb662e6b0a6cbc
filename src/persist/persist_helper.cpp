// C3DStreamHelper: routes values and chunks to the stream's compressor, and counts open chunks.
#include <ut/persist.h>
#include <ut/platform/detail/boundary.h>
#include <ut/sdk/detail/stream_buffer.h>

#include "persist/stock_codec.h"

namespace {

constexpr ULONG kCountingOff = 0xFFFFFFFF;

// Calls the compressor when there is one; the base's operation when there is none or when the
// compressor declines a chunk call on a plain stream (and only then).
template <class ViaCompressor, class ViaBase>
HRESULT Route(I3DStreamCompressor* compressor, ViaCompressor viaCompressor, ViaBase viaBase) {
    if (!compressor)
        return viaBase();
    HRESULT hr = viaCompressor(compressor);
    return hr == STG_E_OLDFORMAT ? viaBase() : hr;
}

} // namespace

C3DStreamHelper::C3DStreamHelper(IStream* stream) : CGWStreamHelper(stream) {
    if (!stream)
        return;
    (void)stream->QueryInterface(IID_I3DStreamCompressor, compressor_.PutVoid()); // none: the plain form
    if (ut::ComPtr<I3DStreamCompressor> stock;
        compressor_ && SUCCEEDED(stream->QueryInterface(ut::persist::IID_StockCompressor, stock.PutVoid())) &&
        stock.Get() == compressor_.Get())
        stock_ = static_cast<C3DStreamCompressor*>(stock.Get()); // kept alive by compressor_
    ut::ComPtr<IUnknown> counting;
    if (SUCCEEDED(stream->QueryInterface(IID_IGWChunkCountingStream, counting.PutVoid())) && counting)
        return;
    if (!compressor_) {
        openDepth_ = kCountingOff;
        return;
    }
    ULONG hostVersionKnown = 0;
    ULONG startDepth = 0;
    (void)compressor_->GetStartCount(hostVersionKnown, startDepth); // a failure leaves depth 0: counting on
    openDepth_ = startDepth;
    ut::ComPtr<IGWStreamCapabilities> capabilities;
    if (SUCCEEDED(stream->QueryInterface(IID_IGWStreamCapabilities, capabilities.PutVoid())) &&
        capabilities && hostVersionKnown == 0 && !capabilities->HasCapability(2))
        openDepth_ = kCountingOff;
}

// Whatever an object left open is closed, innermost first, in the mode of the last open.
C3DStreamHelper::~C3DStreamHelper() {
    if (openDepth_ == 0 || openDepth_ == kCountingOff)
        return;
    for (ULONG remaining = openDepth_; remaining > 0; --remaining)
        (void)CountClose(lastOpenWasRead_ ? RawChunkReadClose()
                                          : RawChunkWriteClose()); // runs its full count
}

// Counting of open chunks. Writing always counts, even on a stream where reading does not.

HRESULT C3DStreamHelper::CountWriteOpen(HRESULT hr) {
    if (openDepth_ == kCountingOff)
        openDepth_ = 0;
    if (SUCCEEDED(hr)) {
        lastOpenWasRead_ = 0;
        ++openDepth_;
    }
    return hr;
}

HRESULT C3DStreamHelper::CountReadOpen(HRESULT hr) {
    if (SUCCEEDED(hr) && openDepth_ != kCountingOff) {
        lastOpenWasRead_ = 1;
        ++openDepth_;
    }
    return hr;
}

HRESULT C3DStreamHelper::CountClose(HRESULT hr) {
    if (SUCCEEDED(hr) && openDepth_ != kCountingOff)
        --openDepth_;
    return hr;
}

// Values. A plain stream pays one test, as before; the library's own compressor is called
// directly and any other one through its interface. Each starts on a cache line of its own: a
// call costs a few nanoseconds, and where the rest of the library happened to put them moved
// single rows of ut_bench_persist by up to a sixth.

[[gnu::aligned(64)]] HRESULT C3DStreamHelper::PutUInt32(ULONG value) {
    if (!compressor_)
        return CGWStreamHelper::PutUInt32(value);
    return stock_ ? ut::persist::StockCodec::SaveUInt32(*stock_, value)
                  : compressor_->SavePackedVarLenUInt32(value);
}

[[gnu::aligned(64)]] HRESULT C3DStreamHelper::GetUInt32(ULONG& value) {
    if (!compressor_)
        return CGWStreamHelper::GetUInt32(value);
    return stock_ ? ut::persist::StockCodec::LoadUInt32(*stock_, value)
                  : compressor_->LoadPackedVarLenUInt32(value);
}

HRESULT C3DStreamHelper::SkipUInt32() {
    return compressor_ ? compressor_->SkipPackedVarLenUInt32() : CGWStreamHelper::SkipUInt32();
}

HRESULT C3DStreamHelper::StoreUInt32(ULONG value) {
    return compressor_ ? compressor_->SavePackedVarLenUInt32ForPatchBack(value) : PutUInt32(value);
}

[[gnu::aligned(64)]] HRESULT C3DStreamHelper::PutInt32(LONG value) {
    if (!compressor_)
        return CGWStreamHelper::PutInt32(value);
    return stock_ ? ut::persist::StockCodec::SaveInt32(*stock_, value)
                  : compressor_->SavePackedVarLenInt32(value);
}

[[gnu::aligned(64)]] HRESULT C3DStreamHelper::GetInt32(LONG& value) {
    if (!compressor_)
        return CGWStreamHelper::GetInt32(value);
    return stock_ ? ut::persist::StockCodec::LoadInt32(*stock_, value)
                  : compressor_->LoadPackedVarLenInt32(value);
}

HRESULT C3DStreamHelper::SkipInt32() {
    return compressor_ ? compressor_->SkipPackedVarLenInt32() : CGWStreamHelper::SkipInt32();
}

[[gnu::aligned(64)]] HRESULT C3DStreamHelper::PutDouble(double value) {
    if (!compressor_)
        return CGWStreamHelper::PutDouble(value);
    return stock_ ? ut::persist::StockCodec::SaveDouble(*stock_, value)
                  : compressor_->SaveVarLenDouble(value);
}

[[gnu::aligned(64)]] HRESULT C3DStreamHelper::GetDouble(double& value) {
    if (!compressor_)
        return CGWStreamHelper::GetDouble(value);
    return stock_ ? ut::persist::StockCodec::LoadDouble(*stock_, value)
                  : compressor_->LoadVarLenDouble(value);
}

HRESULT C3DStreamHelper::SkipDouble() {
    return compressor_ ? compressor_->SkipVarLenDouble() : CGWStreamHelper::SkipDouble();
}

// Strings always take the base's wide-string form.

HRESULT C3DStreamHelper::PutString(const CKXString& text) {
    return CGWStreamHelper::PutUnicodeString(text.Length() ? text.c_str() : L"", -1);
}

// One pass over the string, decoded straight into the text that `text` then takes over: the
// same result as asking the base for the length and then for a string of that size, without
// decoding the string twice or copying it out of a buffer of its own.
HRESULT C3DStreamHelper::GetString(CKXString& text) {
    std::wstring read;
    HRESULT hr = ut::ExportBoundary([&] { return ut::sdk::ReadWideText(Buffer(), read); });
    if (FAILED(hr))
        return hr;
    text = CKXString(std::move(read));
    return S_OK;
}

// Chunks. The library's own compressor is called without the virtual dispatch, as for values.

HRESULT C3DStreamHelper::ChunkPeekHeader(ULONG* id, ULONG* version) {
    return Route(
        compressor_.Get(), [&](I3DStreamCompressor* c) { return c->ChunkPeekHeader(id, version); },
        [&] { return CGWStreamHelper::ChunkPeekHeader(id, version); });
}

HRESULT C3DStreamHelper::SkipChunk() {
    return Route(
        compressor_.Get(), [](I3DStreamCompressor* c) { return c->SkipChunk(); },
        [&] { return CGWStreamHelper::SkipChunk(); });
}

HRESULT C3DStreamHelper::ChunkWriteOpen(ULONG id, ULONG version) {
    return CountWriteOpen(Route(
        compressor_.Get(),
        [&](I3DStreamCompressor* c) {
            return stock_ ? stock_->C3DStreamCompressor::ChunkWriteOpen(id, version)
                          : c->ChunkWriteOpen(id, version);
        },
        [&] { return CGWStreamHelper::ChunkWriteOpen(id, version); }));
}

HRESULT C3DStreamHelper::ChunkSafeWriteOpen(ULONG id, ULONG version) {
    return CountWriteOpen(Route(
        compressor_.Get(), [&](I3DStreamCompressor* c) { return c->ChunkSafeWriteOpen(id, version); },
        [&] { return CGWStreamHelper::ChunkWriteOpen(id, version); }));
}

HRESULT C3DStreamHelper::ChunkReadOpen(ULONG id, ULONG* version) {
    return CountReadOpen(Route(
        compressor_.Get(),
        [&](I3DStreamCompressor* c) {
            return stock_ ? stock_->C3DStreamCompressor::ChunkReadOpen(id, version)
                          : c->ChunkReadOpen(id, version);
        },
        [&] { return CGWStreamHelper::ChunkReadOpen(id, version); }));
}

HRESULT C3DStreamHelper::ChunkSafeReadOpen(ULONG id, ULONG* version) {
    return CountReadOpen(Route(
        compressor_.Get(), [&](I3DStreamCompressor* c) { return c->ChunkSafeReadOpen(id, version); },
        [&] { return CGWStreamHelper::ChunkReadOpen(id, version); }));
}

HRESULT C3DStreamHelper::ChunkWriteClose() {
    return CountClose(RawChunkWriteClose());
}

HRESULT C3DStreamHelper::ChunkReadClose() {
    return CountClose(RawChunkReadClose());
}

HRESULT C3DStreamHelper::RawChunkWriteClose() {
    return Route(
        compressor_.Get(),
        [&](I3DStreamCompressor* c) {
            return stock_ ? stock_->C3DStreamCompressor::ChunkWriteClose() : c->ChunkWriteClose();
        },
        [&] { return CGWStreamHelper::ChunkWriteClose(); });
}

HRESULT C3DStreamHelper::RawChunkReadClose() {
    return Route(
        compressor_.Get(),
        [&](I3DStreamCompressor* c) {
            return stock_ ? stock_->C3DStreamCompressor::ChunkReadClose() : c->ChunkReadClose();
        },
        [&] { return CGWStreamHelper::ChunkReadClose(); });
}
