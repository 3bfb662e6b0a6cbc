// The system's own streams, one over a movable global block and one over a file, seen through a
// thin wrapper where the system's answers differ from each other or leave a choice open. The
// wrapper applies the rules of common/stream_base.h, which the POSIX streams follow too:
// - a read that reaches the end succeeds with S_OK (the file stream answers S_FALSE);
// - the bytes between the end and a write or SetSize past it read as zeros (the memory stream
//   grows its block without clearing it);
// - Seek checks its target first, so a memory stream refuses a position past 4 GiB instead of
//   wrapping it, and every refused Seek answers STG_E_INVALIDFUNCTION;
// - access follows the mode the stream was opened with, and Stat reports that mode, a stream
//   type and the path as given;
// - null pointers answer STG_E_INVALIDPOINTER instead of faulting.
#include <algorithm>
#include <new>
#include <shlwapi.h>
#include <string>
#include <utility>

#include "common/stream_base.h"

namespace ut::platform {
namespace {

// Win32 codes for a missing file or an access refusal, as the storage codes both homes answer.
HRESULT AsStorageCode(HRESULT hr) {
    if (hr == HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND) || hr == HRESULT_FROM_WIN32(ERROR_PATH_NOT_FOUND))
        return STG_E_FILENOTFOUND;
    if (hr == E_ACCESSDENIED)
        return STG_E_ACCESSDENIED;
    return hr;
}

class SystemStream final : public StreamBase {
public:
    SystemStream(ComPtr<IStream> inner, std::wstring name, DWORD mode, bool inMemory)
        : inner_(std::move(inner)), name_(std::move(name)), mode_(mode), inMemory_(inMemory) {}

    // Hands out a new wrapper around `inner` through `stream`.
    static HRESULT Wrap(ComPtr<IStream> inner, std::wstring name, DWORD mode, bool inMemory,
                        IStream** stream) {
        *stream = new (std::nothrow) SystemStream(std::move(inner), std::move(name), mode, inMemory);
        return *stream ? S_OK : E_OUTOFMEMORY;
    }

    HRESULT STDMETHODCALLTYPE Read(void* buffer, ULONG count, ULONG* read) override {
        if (read)
            *read = 0;
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        if (!CanRead(mode_))
            return STG_E_ACCESSDENIED;
        // The system's memory stream miscounts what is left when its position is past its end.
        if (inMemory_) {
            ULONGLONG position = 0, size = 0;
            if (HRESULT hr = Position(position); FAILED(hr))
                return hr;
            if (HRESULT hr = Size(size); FAILED(hr))
                return hr;
            if (position >= size)
                return S_OK;
        }
        HRESULT hr = inner_->Read(buffer, count, read);
        return hr == S_FALSE ? S_OK : hr;
    }

    HRESULT STDMETHODCALLTYPE Write(const void* buffer, ULONG count, ULONG* written) override {
        if (written)
            *written = 0;
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        if (count == 0)
            return S_OK;
        if (inMemory_) {
            if (HRESULT hr = PrepareMemoryWrite(count); FAILED(hr))
                return hr;
        }
        return inner_->Write(buffer, count, written);
    }

    HRESULT STDMETHODCALLTYPE Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) override {
        ULONGLONG current = 0;
        ULONGLONG size = 0;
        HRESULT hr = origin == STREAM_SEEK_CUR   ? Position(current)
                     : origin == STREAM_SEEK_END ? Size(size)
                                                 : S_OK;
        if (FAILED(hr))
            return hr;
        ULONGLONG target = 0;
        if (!NewPosition(move, origin, current, size, target) || (inMemory_ && target > kMaxMemorySize))
            return STG_E_INVALIDFUNCTION;
        return SeekTo(target, position);
    }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        if (!inMemory_)
            return inner_->SetSize(size);
        if (size.QuadPart > kMaxMemorySize)
            return STG_E_MEDIUMFULL;
        ULONGLONG old = 0;
        ULONGLONG position = 0;
        if (HRESULT hr = Size(old); FAILED(hr))
            return hr;
        if (HRESULT hr = Position(position); FAILED(hr))
            return hr;
        if (HRESULT hr = inner_->SetSize(size); FAILED(hr) || size.QuadPart <= old)
            return hr;
        HRESULT cleared = ClearGrownBytes(old, size.QuadPart);
        HRESULT back = SeekTo(position, nullptr);
        return FAILED(cleared) ? cleared : back;
    }

    HRESULT STDMETHODCALLTYPE Commit(DWORD flags) override { return inner_->Commit(flags); }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        ULONGLONG size = 0;
        if (HRESULT hr = Size(size); FAILED(hr))
            return hr;
        return FillStat(stat, flags, size, name_, mode_);
    }

    HRESULT STDMETHODCALLTYPE Clone(IStream** clone) override {
        if (!clone)
            return STG_E_INVALIDPOINTER;
        *clone = nullptr;
        ComPtr<IStream> copy;
        if (HRESULT hr = inner_->Clone(copy.Put()); FAILED(hr))
            return hr;
        return Wrap(std::move(copy), name_, mode_, inMemory_, clone);
    }

private:
    ~SystemStream() override = default;

    HRESULT Position(ULONGLONG& position) {
        LARGE_INTEGER none{};
        ULARGE_INTEGER at{};
        HRESULT hr = inner_->Seek(none, STREAM_SEEK_CUR, &at);
        position = at.QuadPart;
        return hr;
    }

    HRESULT Size(ULONGLONG& size) {
        STATSTG stat{};
        HRESULT hr = inner_->Stat(&stat, STATFLAG_NONAME);
        size = stat.cbSize.QuadPart;
        return hr;
    }

    // The system's memory stream takes moves of less than 2 GiB only (it reads them as signed
    // 32-bit numbers), so a longer one goes in steps.
    HRESULT SeekTo(ULONGLONG target, ULARGE_INTEGER* position) {
        constexpr ULONGLONG kLongestMove = 0x7FFFFFFF;
        DWORD origin = STREAM_SEEK_SET;
        for (;;) {
            LARGE_INTEGER step{};
            step.QuadPart = static_cast<LONGLONG>(std::min(target, kLongestMove));
            target -= static_cast<ULONGLONG>(step.QuadPart);
            bool last = target == 0;
            HRESULT hr = inner_->Seek(step, origin, last ? position : nullptr);
            if (FAILED(hr) || last)
                return hr;
            origin = STREAM_SEEK_CUR;
        }
    }

    // Before a write at the position: refuses to grow past the limit, and grows the block over a
    // gap with zeros. Leaves the position where it was.
    HRESULT PrepareMemoryWrite(ULONG count) {
        ULONGLONG position = 0;
        ULONGLONG size = 0;
        if (HRESULT hr = Position(position); FAILED(hr))
            return hr;
        if (position + count > kMaxMemorySize)
            return STG_E_MEDIUMFULL;
        if (HRESULT hr = Size(size); FAILED(hr) || position <= size)
            return hr;
        ULARGE_INTEGER grown{};
        grown.QuadPart = position;
        if (HRESULT hr = inner_->SetSize(grown); FAILED(hr))
            return hr;
        return ClearGrownBytes(size, position);
    }

    // Writes zeros over [from, to), which the block already holds; the position ends at `to`.
    HRESULT ClearGrownBytes(ULONGLONG from, ULONGLONG to) {
        static constexpr unsigned char kZeros[65536] = {};
        if (HRESULT hr = SeekTo(from, nullptr); FAILED(hr))
            return hr;
        while (from < to) {
            ULONG chunk = static_cast<ULONG>(std::min<ULONGLONG>(sizeof kZeros, to - from));
            ULONG put = 0;
            if (HRESULT hr = inner_->Write(kZeros, chunk, &put); FAILED(hr))
                return hr;
            if (put == 0)
                return STG_E_WRITEFAULT;
            from += put;
        }
        return S_OK;
    }

    ComPtr<IStream> inner_;
    std::wstring name_;
    DWORD mode_;
    bool inMemory_;
};

} // namespace

HRESULT CreateMemoryStream(IStream** stream) {
    if (!stream)
        return E_POINTER;
    *stream = nullptr;
    ComPtr<IStream> memory;
    if (HRESULT hr = CreateStreamOnHGlobal(nullptr, TRUE, memory.Put()); FAILED(hr))
        return hr;
    return SystemStream::Wrap(std::move(memory), std::wstring(), STGM_READWRITE, true, stream);
}

HRESULT OpenFileStream(const wchar_t* path, DWORD mode, IStream** stream) {
    if (HRESULT hr = CheckFileStreamArguments(path, mode, stream); FAILED(hr))
        return hr;
    BOOL create = (mode & STGM_CREATE) ? TRUE : FALSE;
    ComPtr<IStream> file;
    HRESULT hr = SHCreateStreamOnFileEx(path, mode, FILE_ATTRIBUTE_NORMAL, create, nullptr, file.Put());
    if (FAILED(hr))
        return AsStorageCode(hr);
    return SystemStream::Wrap(std::move(file), path, mode, false, stream);
}

} // namespace ut::platform
