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

// An IStream that hands every call to a memory stream of its own; tests derive from it to change
// one behaviour. It lives on the test's stack: AddRef and Release count nothing.
class ForwardingStream : public IStream {
public:
    explicit ForwardingStream(const Bytes& content = {}) : inner_(StreamOf(content)) {}
    virtual ~ForwardingStream() = default;

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        *object = nullptr;
        if (!IsEqualGUID(iid, IID_IUnknown) && !IsEqualGUID(iid, IID_IStream) &&
            !IsEqualGUID(iid, IID_ISequentialStream))
            return E_NOINTERFACE;
        *object = static_cast<IStream*>(this);
        return S_OK;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return 2; }
    ULONG STDMETHODCALLTYPE Release() override { return 1; }
    HRESULT STDMETHODCALLTYPE Read(void* b, ULONG n, ULONG* r) override { return inner_->Read(b, n, r); }
    HRESULT STDMETHODCALLTYPE Write(const void* b, ULONG n, ULONG* w) override {
        return inner_->Write(b, n, w);
    }
    HRESULT STDMETHODCALLTYPE Seek(LARGE_INTEGER m, DWORD o, ULARGE_INTEGER* p) override {
        return inner_->Seek(m, o, p);
    }
    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER s) override { return inner_->SetSize(s); }
    HRESULT STDMETHODCALLTYPE CopyTo(IStream* t, ULARGE_INTEGER n, ULARGE_INTEGER* r,
                                     ULARGE_INTEGER* w) override {
        return inner_->CopyTo(t, n, r, w);
    }
    HRESULT STDMETHODCALLTYPE Commit(DWORD f) override { return inner_->Commit(f); }
    HRESULT STDMETHODCALLTYPE Revert() override { return inner_->Revert(); }
    HRESULT STDMETHODCALLTYPE LockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override { return E_NOTIMPL; }
    HRESULT STDMETHODCALLTYPE UnlockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override {
        return E_NOTIMPL;
    }
    HRESULT STDMETHODCALLTYPE Stat(STATSTG* s, DWORD f) override { return inner_->Stat(s, f); }
    HRESULT STDMETHODCALLTYPE Clone(IStream**) override { return E_NOTIMPL; }

    Bytes Content() const { return BytesOf(inner_.Get()); }

private:
    ComPtr<IStream> inner_;
};

// A stream whose writes fail while `refusals` is above zero, each refusal counting one down.
class RefusingStream final : public ForwardingStream {
public:
    HRESULT STDMETHODCALLTYPE Write(const void* b, ULONG n, ULONG* w) override {
        if (refusals > 0) {
            --refusals;
            return STG_E_MEDIUMFULL;
        }
        return ForwardingStream::Write(b, n, w);
    }

    int refusals = 0;
};

} // namespace ut::test
