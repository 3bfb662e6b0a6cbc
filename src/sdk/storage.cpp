// The host's structured-storage calls, over the platform's compound files and byte arrays.
#include <ut/platform/storage.h>
#include <ut/sdk/storage.h>

HRESULT GWOpenOrCreateILockBytes(const wchar_t* path, DWORD mode, BOOL open, ILockBytes** bytes) {
    if (!bytes)
        return E_POINTER;
    *bytes = nullptr;
    DWORD wanted = open ? (mode & ~STGM_CREATE) : (mode | STGM_CREATE);
    return ut::platform::OpenFileLockBytes(path, wanted, bytes);
}

HRESULT GWOpenOrCreateStorage2(IStorage* parent, const wchar_t* name, SNB exclude, DWORD mode, BOOL open,
                               IStorage** storage, ILockBytes* bytes) {
    if (!storage)
        return E_POINTER;
    *storage = nullptr;
    DWORD creating = mode | STGM_CREATE;
    if (parent) {
        return open ? parent->OpenStorage(name, nullptr, mode, exclude, 0, storage)
                    : parent->CreateStorage(name, creating, 0, 0, storage);
    }
    if (bytes) {
        DWORD kept = ~DWORD{STGM_DELETEONRELEASE};
        return open ? StgOpenStorageOnILockBytes(bytes, nullptr, mode & kept, exclude, 0, storage)
                    : StgCreateDocfileOnILockBytes(bytes, creating & kept, 0, storage);
    }
    return open ? StgOpenStorage(name, nullptr, mode, exclude, 0, storage)
                : StgCreateDocfile(name, creating, 0, storage);
}
