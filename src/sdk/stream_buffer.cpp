#include <algorithm>
#include <new>

#include <ut/sdk/stream_buffer.h>

namespace ut::sdk {
namespace {

LARGE_INTEGER Offset(LONGLONG value) {
    LARGE_INTEGER offset;
    offset.QuadPart = value;
    return offset;
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

HRESULT StreamBuffer::SeekStream(ULONGLONG position) {
    return stream_->Seek(Offset(static_cast<LONGLONG>(position)), STREAM_SEEK_SET, nullptr);
}

HRESULT StreamBuffer::Flush() {
    if (dirtyEnd_ <= dirtyBegin_)
        return S_OK;
    if (HRESULT hr = SeekStream(base_ + dirtyBegin_); FAILED(hr))
        return hr;
    ULONG count = dirtyEnd_ - dirtyBegin_;
    ULONG written = 0;
    HRESULT hr = stream_->Write(data_.get() + dirtyBegin_, count, &written);
    if (FAILED(hr))
        return hr;
    if (written != count)
        return STG_E_WRITEFAULT;
    dirtyBegin_ = kCapacity;
    dirtyEnd_ = 0;
    return S_OK;
}

HRESULT StreamBuffer::Sync() {
    if (!stream_)
        return E_POINTER;
    if (HRESULT hr = Flush(); FAILED(hr))
        return hr;
    return SeekStream(Position());
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
    if (HRESULT hr = SeekStream(base_); FAILED(hr))
        return hr;
    ULONG read = 0;
    HRESULT hr = stream_->Read(data_.get(), limit_, &read);
    if (FAILED(hr))
        return hr;
    valid_ = std::min(read, limit_);
    return S_OK;
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
    if (HRESULT hr = SeekStream(position); FAILED(hr))
        return hr;
    ULONG written = 0;
    HRESULT hr = stream_->Write(bytes, count, &written);
    if (FAILED(hr))
        return hr;
    if (written != count)
        return STG_E_WRITEFAULT;
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
    if (HRESULT hr = SeekStream(position); FAILED(hr))
        return hr;
    ULONG read = 0;
    HRESULT hr = stream_->Read(bytes, count, &read);
    if (FAILED(hr))
        return hr;
    if (read != count)
        return STG_E_READFAULT;
    return StartWindow(position + count);
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
