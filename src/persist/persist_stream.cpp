// The stream object applications open around the streams they save and load: one buffered
// stream that every helper shares, and the compressor that decides the stream's form.
//
// The compressor is bound to the inner buffered stream rather than to this object, so that the
// reference it holds on its stream does not keep this object alive.
#include <new>

#include <ut/persist.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/detail/stream_buffer.h>

#include "module/state.h"
#include "persist/stock_codec.h"

namespace ut::persist {
namespace {

// {0D7B3C52-41E6-4C0A-9F1B-6A2E8D5C7B13}: finds the object behind an IStream that we opened.
constexpr IID IID_PersistStream = {
    0x0D7B3C52, 0x41E6, 0x4C0A, {0x9F, 0x1B, 0x6A, 0x2E, 0x8D, 0x5C, 0x7B, 0x13}};

class PersistStream final : public ut::sdk::ComObject<IStream, IGWStreamBufferSource> {
public:
    // The compressor, embedded: its identity and lifetime are the stream object's.
    class EmbeddedCompressor final : public C3DStreamCompressor {
    public:
        explicit EmbeddedCompressor(PersistStream& owner) : owner_(owner) {}
        HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
            return owner_.QueryInterface(iid, object);
        }
        ULONG STDMETHODCALLTYPE AddRef() override { return owner_.AddRef(); }
        ULONG STDMETHODCALLTYPE Release() override { return owner_.Release(); }

    private:
        PersistStream& owner_;
    };

    PersistStream(ComPtr<IStream> buffered, ComPtr<IStream> table, bool saving)
        : buffered_(std::move(buffered)), table_(std::move(table)), saving_(saving), compressor_(*this) {
        ComPtr<IGWStreamBufferSource> source;
        (void)buffered_->QueryInterface(IID_IGWStreamBufferSource, source.PutVoid()); // ours: always answers
        buffer_ = source->GetStreamBuffer();
    }

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            ut::sdk::Entry<PersistStream, IStream>(IID_IStream),
            ut::sdk::Entry<PersistStream, IStream>(IID_ISequentialStream),
            ut::sdk::Entry<PersistStream, IGWStreamBufferSource>(IID_IGWStreamBufferSource),
            ut::sdk::Entry<PersistStream, IStream>(IID_IGWChunkCountingStream),
            ut::sdk::Entry<PersistStream, PersistStream>(IID_PersistStream),
            {&IID_I3DStreamCompressor, &CompressorOf},
            {&IID_StockCompressor, &CompressorOf}, // EmbeddedCompressor keeps the stock value operations
        };
        return map;
    }

    HRESULT OpenForSave() {
        if (HRESULT hr = EmptyIfAtStart(); FAILED(hr))
            return hr;
        return compressor_.Init(buffered_.Get(), table_ ? 1 : 0, 0);
    }

    HRESULT OpenForLoad() {
        // An empty stream has nothing to decide; binding would write the marker into it.
        ULONGLONG size = 0;
        if (HRESULT hr = buffer_->Size(&size); FAILED(hr))
            return hr;
        if (size == 0)
            return S_OK;
        if (HRESULT hr = compressor_.Init(buffered_.Get(), 0, 0); FAILED(hr))
            return hr;
        return table_ ? compressor_.PreRead(table_.Get()) : S_OK;
    }

    HRESULT Close() {
        if (closed_)
            return S_FALSE;
        closed_ = true;
        HRESULT hr = S_OK;
        if (saving_ && table_)
            hr = compressor_.Term(table_.Get(), 0);
        HRESULT synced = buffer_->Sync();
        return FAILED(hr) ? hr : synced;
    }

    ut::sdk::StreamBuffer* STDMETHODCALLTYPE GetStreamBuffer() override { return buffer_; }

    HRESULT STDMETHODCALLTYPE Read(void* bytes, ULONG count, ULONG* read) override {
        return buffered_->Read(bytes, count, read);
    }
    HRESULT STDMETHODCALLTYPE Write(const void* bytes, ULONG count, ULONG* written) override {
        return buffered_->Write(bytes, count, written);
    }
    HRESULT STDMETHODCALLTYPE Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) override {
        return buffered_->Seek(move, origin, position);
    }
    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override { return buffered_->SetSize(size); }
    HRESULT STDMETHODCALLTYPE CopyTo(IStream* target, ULARGE_INTEGER count, ULARGE_INTEGER* read,
                                     ULARGE_INTEGER* written) override {
        return buffered_->CopyTo(target, count, read, written);
    }
    HRESULT STDMETHODCALLTYPE Commit(DWORD flags) override { return buffered_->Commit(flags); }
    HRESULT STDMETHODCALLTYPE Revert() override { return buffered_->Revert(); }
    HRESULT STDMETHODCALLTYPE LockRegion(ULARGE_INTEGER offset, ULARGE_INTEGER count, DWORD type) override {
        return buffered_->LockRegion(offset, count, type);
    }
    HRESULT STDMETHODCALLTYPE UnlockRegion(ULARGE_INTEGER offset, ULARGE_INTEGER count, DWORD type) override {
        return buffered_->UnlockRegion(offset, count, type);
    }
    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        return buffered_->Stat(stat, flags);
    }
    HRESULT STDMETHODCALLTYPE Clone(IStream** clone) override { return buffered_->Clone(clone); }

private:
    static void* CompressorOf(CGWCOMObject* self) {
        return static_cast<I3DStreamCompressor*>(&static_cast<PersistStream*>(self)->compressor_);
    }

    // A save from the start replaces what the stream held.
    HRESULT EmptyIfAtStart() {
        if (buffer_->Position() != 0)
            return S_OK;
        ULARGE_INTEGER empty{};
        return buffered_->SetSize(empty);
    }

    ComPtr<IStream> buffered_;
    ComPtr<IStream> table_;
    ut::sdk::StreamBuffer* buffer_ = nullptr;
    bool saving_;
    bool closed_ = false;
    EmbeddedCompressor compressor_;
};

HRESULT Open(IStream* target, IStream* table, bool saving, IStream** stream) {
    if (!stream)
        return E_POINTER;
    *stream = nullptr;
    if (!ut::module::Loaded())
        return E_UNEXPECTED;
    if (!target)
        return E_INVALIDARG;
    ComPtr<IStream> buffered;
    if (HRESULT hr = ut::sdk::CreateBufferedStream(target, buffered.Put()); FAILED(hr))
        return hr;
    auto* made = new (std::nothrow) PersistStream(std::move(buffered), ComPtr<IStream>(table), saving);
    if (!made)
        return E_OUTOFMEMORY;
    ComPtr<IStream> owner = ComPtr<IStream>::Adopt(made);
    HRESULT hr = saving ? made->OpenForSave() : made->OpenForLoad();
    if (FAILED(hr))
        return hr;
    *stream = owner.Detach();
    return S_OK;
}

} // namespace
} // namespace ut::persist

HRESULT KXOpenPersistStreamForSave(IStream* target, IStream* table, IStream** stream) {
    return ut::persist::Open(target, table, true, stream);
}

HRESULT KXOpenPersistStreamForLoad(IStream* source, IStream* table, IStream** stream) {
    return ut::persist::Open(source, table, false, stream);
}

HRESULT KXClosePersistStream(IStream* stream) {
    if (!ut::module::Loaded())
        return E_UNEXPECTED;
    if (!stream)
        return E_INVALIDARG;
    ut::ComPtr<ut::persist::PersistStream> found;
    if (FAILED(stream->QueryInterface(ut::persist::IID_PersistStream, found.PutVoid())) || !found)
        return E_INVALIDARG;
    return found->Close();
}
