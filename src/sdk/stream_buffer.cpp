// StreamBuffer: the shared 64 KiB window between stream helpers and their stream.
#include <algorithm>
#include <new>

#include <ut/sdk/detail/stream_buffer.h>

namespace ut::sdk {
namespace {

LARGE_INTEGER Offset(LONGLONG value) {
    LARGE_INTEGER offset;
    offset.QuadPart = value;
    return offset;
}

HRESULT SeekTo(IStream* stream, ULONGLONG position) {
    return stream->Seek(Offset(static_cast<LONGLONG>(position)), STREAM_SEEK_SET, nullptr);
}

// All `count` bytes at `position` of the stream, or a failure.
HRESULT WriteAt(IStream* stream, ULONGLONG position, const void* bytes, ULONG count) {
    if (HRESULT hr = SeekTo(stream, position); FAILED(hr))
        return hr;
    ULONG written = 0;
    HRESULT hr = stream->Write(bytes, count, &written);
    return FAILED(hr) ? hr : written == count ? S_OK : STG_E_WRITEFAULT;
}

// Up to `count` bytes at `position`; `read` says how many the stream had.
HRESULT ReadAt(IStream* stream, ULONGLONG position, void* bytes, ULONG count, ULONG& read) {
    read = 0;
    if (HRESULT hr = SeekTo(stream, position); FAILED(hr))
        return hr;
    return stream->Read(bytes, count, &read);
}

} // namespace

StreamBuffer::StreamBuffer(IStream* stream) : stream_(stream) {
    if (!stream_)
        return;
    ULARGE_INTEGER position{};
    if (SUCCEEDED(stream_->Seek(Offset(0), STREAM_SEEK_CUR, &position)) && position.QuadPart <= kMaxPosition)
        base_ = position.QuadPart;
    data_.reset(new (std::nothrow) BYTE[kCapacity]);
    if (data_)
        limit_ = static_cast<ULONG>(std::min<ULONGLONG>(kCapacity, kMaxPosition + 1 - base_));
}

StreamBuffer::~StreamBuffer() {
    Sync();
}

HRESULT StreamBuffer::Flush() {
    if (dirtyEnd_ <= dirtyBegin_)
        return S_OK;
    HRESULT hr =
        WriteAt(stream_.Get(), base_ + dirtyBegin_, data_.get() + dirtyBegin_, dirtyEnd_ - dirtyBegin_);
    if (FAILED(hr))
        return hr;
    dirtyBegin_ = kCapacity;
    dirtyEnd_ = 0;
    return S_OK;
}

HRESULT StreamBuffer::Sync() {
    if (!stream_)
        return E_POINTER;
    if (HRESULT hr = Flush(); FAILED(hr))
        return hr;
    return SeekTo(stream_.Get(), Position());
}

HRESULT StreamBuffer::StartWindow(ULONGLONG position) {
    if (position > kMaxPosition)
        return STG_E_SEEKERROR;
    if (HRESULT hr = Flush(); FAILED(hr))
        return hr;
    base_ = position;
    cursor_ = 0;
    valid_ = 0;
    if (data_)
        limit_ = static_cast<ULONG>(std::min<ULONGLONG>(kCapacity, kMaxPosition + 1 - base_));
    return S_OK;
}

HRESULT StreamBuffer::Fill() {
    ULONG read = 0;
    HRESULT hr = ReadAt(stream_.Get(), base_, data_.get(), limit_, read);
    valid_ = std::min(read, limit_);
    return hr;
}

HRESULT StreamBuffer::WriteSlow(const void* bytes, ULONG count) {
    if (!stream_ || !data_)
        return Unusable();
    ULONGLONG position = Position();
    if (count > kMaxPosition + 1 - position)
        return STG_E_MEDIUMFULL;
    if (HRESULT hr = StartWindow(position); FAILED(hr))
        return hr;
    if (count <= limit_)
        return Write(bytes, count);
    // Larger than a window: straight to the stream.
    if (HRESULT hr = WriteAt(stream_.Get(), position, bytes, count); FAILED(hr))
        return hr;
    return StartWindow(position + count);
}

HRESULT StreamBuffer::ReadSlow(void* bytes, ULONG count) {
    if (!stream_ || !data_)
        return Unusable();
    ULONGLONG position = Position();
    if (HRESULT hr = StartWindow(position); FAILED(hr))
        return hr;
    if (count <= limit_) {
        if (HRESULT hr = Fill(); FAILED(hr))
            return hr;
        return count <= valid_ ? Read(bytes, count) : STG_E_READFAULT;
    }
    // Larger than a window: straight from the stream.
    ULONG read = 0;
    if (HRESULT hr = ReadAt(stream_.Get(), position, bytes, count, read); FAILED(hr))
        return hr;
    return read == count ? StartWindow(position + count) : STG_E_READFAULT;
}

HRESULT StreamBuffer::ReadSome(void* bytes, ULONG count, ULONG* read) {
    ULONG done = 0;
    HRESULT hr = S_OK;
    while (done < count) {
        if (cursor_ == valid_) {
            if (!stream_ || !data_) {
                hr = Unusable();
                break;
            }
            if (FAILED(hr = StartWindow(Position())) || FAILED(hr = Fill()) || valid_ == 0)
                break;
        }
        ULONG part = std::min(valid_ - cursor_, count - done);
        std::memcpy(static_cast<BYTE*>(bytes) + done, data_.get() + cursor_, part);
        cursor_ += part;
        done += part;
    }
    if (read)
        *read = done;
    return hr;
}

HRESULT StreamBuffer::Move(bool backward, ULONG count) {
    ULONGLONG position = Position();
    if (backward)
        return count > position ? STG_E_SEEKERROR : SetPosition(position - count);
    return SetPosition(position + count);
}

HRESULT StreamBuffer::Size(ULONGLONG* size) {
    if (!stream_)
        return E_POINTER;
    if (HRESULT hr = Flush(); FAILED(hr))
        return hr;
    ULARGE_INTEGER end{};
    if (HRESULT hr = stream_->Seek(Offset(0), STREAM_SEEK_END, &end); FAILED(hr))
        return hr;
    *size = std::max<ULONGLONG>(end.QuadPart, base_ + valid_);
    return S_OK;
}

HRESULT StreamBuffer::EnsureReadable(ULONGLONG count) {
    if (count <= valid_ - cursor_)
        return S_OK;
    ULONGLONG size = 0;
    if (HRESULT hr = Size(&size); FAILED(hr))
        return hr;
    ULONGLONG position = Position();
    return position <= size && count <= size - position ? S_OK : STG_E_READFAULT;
}

} // namespace ut::sdk
