// An IStream over a StreamBuffer: whatever goes through it, helper or direct call, sees one
// consistent stream.
#include <new>

#include <ut/sdk/comobject.h>
#include <ut/sdk/detail/stream_buffer.h>

namespace ut::sdk {
namespace {

class BufferedStream final : public ut::sdk::ComObject<IStream, IGWStreamBufferSource> {
public:
    explicit BufferedStream(IStream* inner) : buffer_(inner) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            ut::sdk::Entry<BufferedStream, IStream>(IID_IStream),
            ut::sdk::Entry<BufferedStream, IStream>(IID_ISequentialStream),
            ut::sdk::Entry<BufferedStream, IGWStreamBufferSource>(IID_IGWStreamBufferSource),
        };
        return map;
    }

    StreamBuffer* STDMETHODCALLTYPE GetStreamBuffer() override { return &buffer_; }

    HRESULT STDMETHODCALLTYPE Read(void* bytes, ULONG count, ULONG* read) override {
        if (!bytes && count)
            return STG_E_INVALIDPOINTER;
        return buffer_.ReadSome(bytes, count, read);
    }

    HRESULT STDMETHODCALLTYPE Write(const void* bytes, ULONG count, ULONG* written) override {
        if (written)
            *written = 0;
        if (!bytes && count)
            return STG_E_INVALIDPOINTER;
        HRESULT hr = buffer_.Write(bytes, count);
        if (SUCCEEDED(hr) && written)
            *written = count;
        return hr;
    }

    HRESULT STDMETHODCALLTYPE Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) override {
        ULONGLONG base = 0;
        if (origin == STREAM_SEEK_CUR) {
            base = buffer_.Position();
        } else if (origin == STREAM_SEEK_END) {
            if (HRESULT hr = buffer_.Size(&base); FAILED(hr))
                return hr;
        } else if (origin != STREAM_SEEK_SET) {
            return STG_E_INVALIDFUNCTION;
        }
        LONGLONG target = static_cast<LONGLONG>(base) + move.QuadPart;
        if (target < 0)
            return STG_E_INVALIDFUNCTION;
        if (HRESULT hr = buffer_.SetPosition(static_cast<ULONGLONG>(target)); FAILED(hr))
            return hr;
        if (position)
            position->QuadPart = buffer_.Position();
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        if (HRESULT hr = buffer_.Invalidate(); FAILED(hr))
            return hr;
        return buffer_.Stream()->SetSize(size);
    }

    HRESULT STDMETHODCALLTYPE CopyTo(IStream* target, ULARGE_INTEGER count, ULARGE_INTEGER* read,
                                     ULARGE_INTEGER* written) override {
        if (HRESULT hr = buffer_.Sync(); FAILED(hr))
            return hr;
        ULARGE_INTEGER copied{};
        HRESULT hr = buffer_.Stream()->CopyTo(target, count, &copied, written);
        if (read)
            *read = copied;
        HRESULT moved = buffer_.Invalidate();
        if (SUCCEEDED(moved))
            moved = buffer_.Move(false, static_cast<ULONG>(copied.QuadPart));
        return FAILED(hr) ? hr : moved;
    }

    HRESULT STDMETHODCALLTYPE Commit(DWORD flags) override {
        if (HRESULT hr = buffer_.Flush(); FAILED(hr))
            return hr;
        return buffer_.Stream()->Commit(flags);
    }

    HRESULT STDMETHODCALLTYPE Revert() override {
        if (HRESULT hr = buffer_.Invalidate(); FAILED(hr))
            return hr;
        return buffer_.Stream()->Revert();
    }

    HRESULT STDMETHODCALLTYPE LockRegion(ULARGE_INTEGER offset, ULARGE_INTEGER count, DWORD type) override {
        return buffer_.Stream()->LockRegion(offset, count, type);
    }

    HRESULT STDMETHODCALLTYPE UnlockRegion(ULARGE_INTEGER offset, ULARGE_INTEGER count, DWORD type) override {
        return buffer_.Stream()->UnlockRegion(offset, count, type);
    }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        if (HRESULT hr = buffer_.Flush(); FAILED(hr))
            return hr;
        return buffer_.Stream()->Stat(stat, flags);
    }

    // A clone would read and write past the buffer.
    HRESULT STDMETHODCALLTYPE Clone(IStream** clone) override {
        if (clone)
            *clone = nullptr;
        return STG_E_INVALIDFUNCTION;
    }

private:
    StreamBuffer buffer_;
};

} // namespace

HRESULT CreateBufferedStream(IStream* inner, IStream** buffered) {
    if (!buffered)
        return E_POINTER;
    *buffered = nullptr;
    if (!inner)
        return E_INVALIDARG;
    auto* made = new (std::nothrow) BufferedStream(inner);
    if (!made)
        return E_OUTOFMEMORY;
    *buffered = made;
    return S_OK;
}

} // namespace ut::sdk
