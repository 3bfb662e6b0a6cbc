// What the streams of both homes share: reference counting, interface lookup, the parts of
// IStream that no stream of ours supports, and the rules of Seek and Stat, so that a stream
// answers alike wherever it runs.
#pragma once

#include <algorithm>
#include <atomic>
#include <cstring>
#include <string>

#include <ut/platform/stream.h>

namespace ut::platform {

// Fills a STATSTG: everything zero but the type, size and mode, and the name (task memory)
// unless STATFLAG_NONAME asks for none or there is none.
inline HRESULT FillStatRecord(STATSTG* stat, DWORD flags, DWORD type, ULONGLONG size,
                              const std::wstring& name, DWORD mode) {
    if (!stat)
        return STG_E_INVALIDPOINTER;
    std::memset(stat, 0, sizeof *stat);
    stat->type = type;
    stat->cbSize.QuadPart = size;
    stat->grfMode = mode;
    if ((flags & STATFLAG_NONAME) || name.empty())
        return S_OK;
    auto* copy = static_cast<wchar_t*>(CoTaskMemAlloc((name.size() + 1) * sizeof(wchar_t)));
    if (!copy)
        return STG_E_INSUFFICIENTMEMORY;
    std::memcpy(copy, name.c_str(), (name.size() + 1) * sizeof(wchar_t));
    stat->pwcsName = copy;
    return S_OK;
}

class StreamBase : public IStream {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        if (!object)
            return E_POINTER;
        if (IsEqualGUID(iid, IID_IUnknown) || IsEqualGUID(iid, IID_ISequentialStream) ||
            IsEqualGUID(iid, IID_IStream)) {
            *object = static_cast<IStream*>(this);
            AddRef();
            return S_OK;
        }
        *object = nullptr;
        return E_NOINTERFACE;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return ++references_; }
    ULONG STDMETHODCALLTYPE Release() override {
        ULONG left = --references_;
        if (left == 0)
            delete this;
        return left;
    }

    HRESULT STDMETHODCALLTYPE Commit(DWORD) override { return S_OK; }
    HRESULT STDMETHODCALLTYPE Revert() override { return S_OK; }
    HRESULT STDMETHODCALLTYPE LockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override {
        return STG_E_INVALIDFUNCTION;
    }
    HRESULT STDMETHODCALLTYPE UnlockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override {
        return STG_E_INVALIDFUNCTION;
    }

    // Copies through a bounded buffer, as the system's streams do.
    HRESULT STDMETHODCALLTYPE CopyTo(IStream* target, ULARGE_INTEGER count, ULARGE_INTEGER* read,
                                     ULARGE_INTEGER* written) override {
        if (!target)
            return STG_E_INVALIDPOINTER;
        ULONGLONG totalRead = 0;
        ULONGLONG totalWritten = 0;
        HRESULT hr = S_OK;
        unsigned char buffer[16384];
        while (totalRead < count.QuadPart) {
            ULONG want = static_cast<ULONG>(std::min<ULONGLONG>(sizeof buffer, count.QuadPart - totalRead));
            ULONG got = 0;
            hr = Read(buffer, want, &got);
            if (FAILED(hr) || got == 0)
                break;
            totalRead += got;
            ULONG put = 0;
            hr = target->Write(buffer, got, &put);
            totalWritten += put;
            if (FAILED(hr))
                break;
        }
        if (read)
            read->QuadPart = totalRead;
        if (written)
            written->QuadPart = totalWritten;
        return FAILED(hr) ? hr : S_OK;
    }

protected:
    // A memory stream holds at most what a 32-bit length can count, like the system's.
    static constexpr ULONGLONG kMaxMemorySize = 0xFFFFFFFFull;

    virtual ~StreamBase() = default;

    // Whether a stream opened with `mode` (STGM flags) may be read or written.
    static bool CanRead(DWORD mode) { return (mode & 3) != STGM_WRITE; }
    static bool CanWrite(DWORD mode) { return (mode & 3) != STGM_READ; }

    // Fills the parts of STATSTG that every stream reports the same way.
    static HRESULT FillStat(STATSTG* stat, DWORD flags, ULONGLONG size, const std::wstring& name,
                            DWORD mode) {
        return FillStatRecord(stat, flags, STGTY_STREAM, size, name, mode);
    }

    // Applies a Seek request to a position; false when it would land before the start or the
    // origin is unknown (both answer STG_E_INVALIDFUNCTION).
    static bool NewPosition(LARGE_INTEGER move, DWORD origin, ULONGLONG current, ULONGLONG size,
                            ULONGLONG& position) {
        LONGLONG base = 0;
        switch (origin) {
        case STREAM_SEEK_SET:
            base = 0;
            break;
        case STREAM_SEEK_CUR:
            base = static_cast<LONGLONG>(current);
            break;
        case STREAM_SEEK_END:
            base = static_cast<LONGLONG>(size);
            break;
        default:
            return false;
        }
        LONGLONG target = 0;
        if (__builtin_add_overflow(base, move.QuadPart, &target) || target < 0)
            return false;
        position = static_cast<ULONGLONG>(target);
        return true;
    }

private:
    std::atomic<ULONG> references_{1};
};

// The checks OpenFileStream makes before it asks the system: clears *stream, refuses a null
// or empty path and the access value 3, which names no access.
inline HRESULT CheckFileStreamArguments(const wchar_t* path, DWORD mode, IStream** stream) {
    if (!stream)
        return E_POINTER;
    *stream = nullptr;
    if (!path || !*path)
        return STG_E_INVALIDNAME;
    if ((mode & 3) == 3)
        return STG_E_INVALIDFLAG;
    return S_OK;
}

} // namespace ut::platform
