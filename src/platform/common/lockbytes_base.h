// What the byte arrays of both homes share: the checks before a transfer, and no region locks.
#pragma once

#include <ut/platform/storage.h>

#include "common/object.h"

namespace ut::platform {

class LockBytesBase : public Object<ILockBytes> {
protected:
    // What every ReadAt and WriteAt does first: clears the count and refuses a null buffer.
    static HRESULT BeginTransfer(const void* buffer, ULONG count, ULONG* done) {
        if (done)
            *done = 0;
        return !buffer && count ? STG_E_INVALIDPOINTER : S_OK;
    }

public:
    HRESULT STDMETHODCALLTYPE LockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override {
        return STG_E_INVALIDFUNCTION;
    }
    HRESULT STDMETHODCALLTYPE UnlockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override {
        return STG_E_INVALIDFUNCTION;
    }
};

} // namespace ut::platform
