// A growable stream in memory. Clones share the bytes and keep their own position, as the
// system's memory streams do.
#include <memory>
#include <new>
#include <vector>

#include "common/stream_base.h"

namespace ut::platform::posix {
namespace {

using Bytes = std::vector<unsigned char>;

class MemoryStream final : public StreamBase {
public:
    explicit MemoryStream(std::shared_ptr<Bytes> bytes, ULONGLONG position = 0)
        : bytes_(std::move(bytes)), position_(position) {}

    HRESULT STDMETHODCALLTYPE Read(void* buffer, ULONG count, ULONG* read) override {
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        ULONG copied = 0;
        if (position_ < bytes_->size()) {
            copied = static_cast<ULONG>(std::min<ULONGLONG>(count, bytes_->size() - position_));
            std::memcpy(buffer, bytes_->data() + position_, copied);
            position_ += copied;
        }
        if (read)
            *read = copied;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Write(const void* buffer, ULONG count, ULONG* written) override {
        if (written)
            *written = 0;
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        if (count == 0)
            return S_OK;
        ULONGLONG end = position_ + count;
        if (end > kMaxMemorySize)
            return STG_E_MEDIUMFULL;
        if (end > bytes_->size() && !Grow(end))
            return STG_E_INSUFFICIENTMEMORY;
        std::memcpy(bytes_->data() + position_, buffer, count);
        position_ = end;
        if (written)
            *written = count;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) override {
        ULONGLONG target = 0;
        if (!NewPosition(move, origin, position_, bytes_->size(), target) || target > kMaxMemorySize)
            return STG_E_INVALIDFUNCTION;
        position_ = target;
        if (position)
            position->QuadPart = position_;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        if (size.QuadPart > kMaxMemorySize)
            return STG_E_MEDIUMFULL;
        try {
            bytes_->resize(size.QuadPart);
        } catch (const std::bad_alloc&) {
            return STG_E_INSUFFICIENTMEMORY;
        }
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        return FillStat(stat, flags, bytes_->size(), std::wstring(), STGM_READWRITE);
    }

    HRESULT STDMETHODCALLTYPE Clone(IStream** clone) override {
        if (!clone)
            return STG_E_INVALIDPOINTER;
        *clone = new (std::nothrow) MemoryStream(bytes_, position_);
        return *clone ? S_OK : E_OUTOFMEMORY;
    }

private:
    bool Grow(ULONGLONG end) {
        try {
            if (end > bytes_->capacity())
                bytes_->reserve(std::max<ULONGLONG>(end, bytes_->capacity() * 2));
            bytes_->resize(end);
        } catch (const std::bad_alloc&) {
            return false;
        }
        return true;
    }

    std::shared_ptr<Bytes> bytes_;
    ULONGLONG position_;
};

} // namespace
} // namespace ut::platform::posix

namespace ut::platform {

HRESULT CreateMemoryStream(IStream** stream) {
    if (!stream)
        return E_POINTER;
    *stream = new (std::nothrow) posix::MemoryStream(std::make_shared<posix::Bytes>());
    return *stream ? S_OK : E_OUTOFMEMORY;
}

} // namespace ut::platform
