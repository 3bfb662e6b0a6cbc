// The byte window that every stream helper works through, and the chunk machinery the SDK and
// the library share. Not for plug-ins: the helpers are their interface.
//
// Helpers write and read values of a few bytes each; calling the stream for every value would
// cost a virtual call and a copy per byte. A StreamBuffer keeps a window of the stream in memory
// (up to 64 KiB), answers reads and writes inside it with inline code, and goes to the stream
// only when the window must move. Positions stay exact: Position() is the logical position,
// backward moves inside the window are free, and bytes rewritten inside the window (chunk sizes
// patched at close) are written back with the rest.
//
// Several helpers may work on one stream at once (the compact encoder writes packed values
// through one helper while the caller's helper writes strings through another), so the window
// must be shared per stream: a stream that owns a buffer answers IGWStreamBufferSource, and
// every helper built over it uses that buffer. A helper over any other stream makes its own
// buffer, which flushes and puts the stream at the logical position when it goes.
//
// Positions are 32-bit on streams: moving beyond 0xFFFFFFFF, or before 0, fails with
// STG_E_SEEKERROR and leaves the position where it was. A read past the end fails with
// STG_E_READFAULT and consumes nothing.
#pragma once

#include <bit>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include <ut/platform/stream.h>
#include <ut/sdk/export.h>

static_assert(std::endian::native == std::endian::little, "values are stored in memory order");

namespace ut::sdk {
class StreamBuffer;
}

// {6B0E2A31-8C1D-4F57-A2E4-3D9C5B7A1E60}: private to this SDK; answered by streams that own a
// StreamBuffer.
inline constexpr IID IID_IGWStreamBufferSource = {
    0x6B0E2A31, 0x8C1D, 0x4F57, {0xA2, 0xE4, 0x3D, 0x9C, 0x5B, 0x7A, 0x1E, 0x60}};

struct IGWStreamBufferSource : IUnknown {
    // The buffer lives as long as the object that answers this interface.
    virtual ut::sdk::StreamBuffer* STDMETHODCALLTYPE GetStreamBuffer() = 0;

protected:
    ~IGWStreamBufferSource() = default;
};

template <>
struct ut::InterfaceId<IGWStreamBufferSource> : ut::Iid<IID_IGWStreamBufferSource> {};

namespace ut::sdk {

class UT_SDK_API StreamBuffer {
public:
    static constexpr ULONG kCapacity = 64 * 1024;
    static constexpr ULONGLONG kMaxPosition = 0xFFFFFFFFull;

    // Starts at the stream's current position. A null stream gives a buffer whose every
    // operation fails with E_POINTER.
    explicit StreamBuffer(IStream* stream);
    // Writes back what is pending and leaves the stream at the logical position.
    ~StreamBuffer();
    StreamBuffer(const StreamBuffer&) = delete;
    StreamBuffer& operator=(const StreamBuffer&) = delete;

    HRESULT Write(const void* bytes, ULONG count) {
        if (count > limit_ - cursor_)
            return WriteSlow(bytes, count);
        std::memcpy(data_.get() + cursor_, bytes, count);
        MarkDirty(cursor_, cursor_ + count);
        cursor_ += count;
        if (cursor_ > valid_)
            valid_ = cursor_;
        return S_OK;
    }

    // All `count` bytes or none.
    HRESULT Read(void* bytes, ULONG count) {
        if (count > valid_ - cursor_)
            return ReadSlow(bytes, count);
        std::memcpy(bytes, data_.get() + cursor_, count);
        cursor_ += count;
        return S_OK;
    }

    template <class T>
    HRESULT WriteValue(const T& value) {
        return Write(&value, sizeof value);
    }
    // Leaves `value` as it was when the read fails.
    template <class T>
    HRESULT ReadValue(T& value) {
        return Read(&value, sizeof value);
    }

    // Direct access to the window for encoders and decoders of small values.
    // Room for `count` bytes at the end of the window, or null; Commit(n) then keeps the first n.
    BYTE* Reserve(ULONG count) {
        return cursor_ == valid_ && count <= limit_ - cursor_ ? data_.get() + cursor_ : nullptr;
    }
    void Commit(ULONG count) {
        MarkDirty(cursor_, cursor_ + count);
        cursor_ += count;
        valid_ = cursor_;
    }
    // `count` readable bytes at the position, or null; Advance(n) then consumes n of them.
    const BYTE* Peek(ULONG count) const { return Holds(count) ? Cursor() : nullptr; }
    // The same in two steps, for decoders that would otherwise test the pointer again.
    bool Holds(ULONG count) const { return count <= valid_ - cursor_; }
    const BYTE* Cursor() const { return data_.get() + cursor_; }
    void Advance(ULONG count) { cursor_ += count; }

    // Overwrites `count` bytes at `position` when the window holds them all, without moving;
    // false, with nothing written, otherwise. For patching a size written earlier.
    bool Overwrite(ULONGLONG position, const void* bytes, ULONG count) {
        if (position < base_ || position - base_ > valid_ || count > valid_ - (position - base_))
            return false;
        const auto at = static_cast<ULONG>(position - base_);
        std::memcpy(data_.get() + at, bytes, count);
        MarkDirty(at, at + count);
        return true;
    }

    // Up to `count` bytes; fewer only at the end of the stream. For IStream::Read.
    HRESULT ReadSome(void* bytes, ULONG count, ULONG* read);

    ULONGLONG Position() const { return base_ + cursor_; }
    HRESULT SetPosition(ULONGLONG position) {
        if (position >= base_ && position - base_ <= valid_) {
            cursor_ = static_cast<ULONG>(position - base_);
            return S_OK;
        }
        return StartWindow(position);
    }
    HRESULT Move(bool backward, ULONG count);

    // S_OK when `count` more bytes can be read from the position, STG_E_READFAULT when the
    // stream ends before. Checked before allocating for a count read from the stream.
    HRESULT EnsureReadable(ULONGLONG count);
    // The stream's size, pending bytes included.
    HRESULT Size(ULONGLONG* size);

    // Writes pending bytes back to the stream.
    HRESULT Flush();
    // Flushes and puts the stream itself at the logical position, for direct use of the stream.
    HRESULT Sync();
    // Flushes and forgets the window: the stream may have changed underneath.
    HRESULT Invalidate() { return StartWindow(Position()); }

    IStream* Stream() const { return stream_.Get(); }

private:
    HRESULT WriteSlow(const void* bytes, ULONG count);
    HRESULT ReadSlow(void* bytes, ULONG count);
    // Flushes and starts an empty window at `position`.
    HRESULT StartWindow(ULONGLONG position);
    HRESULT Fill();
    HRESULT Unusable() const { return stream_ ? E_OUTOFMEMORY : E_POINTER; }
    // Widens the range of the window that Flush writes back to cover [begin, end).
    void MarkDirty(ULONG begin, ULONG end) {
        if (begin < dirtyBegin_)
            dirtyBegin_ = begin;
        if (end > dirtyEnd_)
            dirtyEnd_ = end;
    }

    ComPtr<IStream> stream_;
    std::unique_ptr<BYTE[]> data_;
    ULONGLONG base_ = 0; // stream position of data_[0]
    ULONG limit_ = 0;    // usable bytes of the window (0 when there is no window)
    ULONG cursor_ = 0;   // logical position inside the window; never beyond valid_
    ULONG valid_ = 0;    // bytes of the window that hold the stream's content
    ULONG dirtyBegin_ = kCapacity;
    ULONG dirtyEnd_ = 0;
};

// Puts the buffer back where it was when the operation it guards fails:
//   Rewind rewind(buffer); ... return rewind(hr);
class Rewind {
public:
    explicit Rewind(StreamBuffer& buffer) : buffer_(buffer), start_(buffer.Position()) {}
    HRESULT operator()(HRESULT hr) {
        if (FAILED(hr))
            Always();
        return hr;
    }
    // Back to the start whatever happened (for a look ahead).
    void Always() { buffer_.SetPosition(start_); }
    ULONGLONG Start() const { return start_; }

private:
    StreamBuffer& buffer_;
    ULONGLONG start_;
};

// The chunk id of a four-character name: the bytes in written order, each sign-extended.
UT_SDK_API ULONG ChunkIdFromName(const char* name);
// Reads the wide string at the position into `text`, decoded straight from the window. A null
// string reads as an empty one with S_FALSE. On failure nothing is consumed.
UT_SDK_API HRESULT ReadWideText(StreamBuffer& buffer, std::wstring& text);
// Closes the innermost chunk open for writing: pops the start of its body and writes the body's
// size into the 4 bytes before it (an empty body keeps the 0 written at the open).
UT_SDK_API HRESULT CloseWrittenChunk(StreamBuffer& buffer, std::vector<ULONGLONG>& bodyStarts);

// An IStream that goes through a StreamBuffer of its own and answers IGWStreamBufferSource, so
// that helpers built over it share the buffer. Clone is not supported.
UT_SDK_API HRESULT CreateBufferedStream(IStream* inner, IStream** buffered);

} // namespace ut::sdk
