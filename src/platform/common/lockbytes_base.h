// What the byte arrays of both homes share: no region locks.
#pragma once

#include <ut/platform/storage.h>

#include "common/object.h"

namespace ut::platform {

class LockBytesBase : public Object<ILockBytes> {
public:
    HRESULT STDMETHODCALLTYPE LockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override {
        return STG_E_INVALIDFUNCTION;
    }
    HRESULT STDMETHODCALLTYPE UnlockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override {
        return STG_E_INVALIDFUNCTION;
    }
};

} // namespace ut::platform
