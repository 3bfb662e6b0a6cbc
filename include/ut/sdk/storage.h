// The host's structured-storage calls: a byte array over a file, and a compound file opened or
// created inside a parent storage, over a byte array or on a file.
//
// Out-parameters are cleared first; a null one answers E_POINTER. Failures of the platform's
// storage calls pass through unchanged.
#pragma once

#include <ut/platform/storage.h>
#include <ut/sdk/export.h>

// Opens (`open` nonzero) the byte array over the file `path`, or creates it, replacing what
// the file held. `mode` gives the access and may add STGM_DELETEONRELEASE, which deletes the
// file when the byte array's last reference goes. Opening a missing file answers
// STG_E_FILENOTFOUND.
UT_SDK_API HRESULT GWOpenOrCreateILockBytes(const wchar_t* path, DWORD mode, BOOL open, ILockBytes** bytes);

// Opens (`open` nonzero) or creates a storage: with a parent, the parent's element `name`;
// otherwise, with a byte array, the compound file in it; otherwise the compound file `name`.
// Creating always replaces what was there (STGM_CREATE is added). Over a byte array
// STGM_DELETEONRELEASE is left to the byte array, which owns the bytes. `exclude` names
// elements to open empty, as the platform's open calls take it.
UT_SDK_API HRESULT GWOpenOrCreateStorage2(IStorage* parent, const wchar_t* name, SNB exclude, DWORD mode,
                                          BOOL open, IStorage** storage, ILockBytes* bytes);
