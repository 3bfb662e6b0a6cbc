// The host's registration services: in-process COM classes in the system's class registry, the
// host's core registry branch, and the tidying of registry keys after a removal.
//
// The class registry is HKEY_CLASSES_ROOT\CLSID, laid out as the system lays out an in-process
// server: the key named by the class's braced identifier text holds the class's name as its
// default value, and its sub-key "InprocServer32" holds the module's full file name as its
// default value and "ThreadingModel" = "Apartment" (the library and its plug-ins run on the
// application's main thread).
//
// Every service asks ut::sdk::CheckHostFault first, under its own name, and answers a failure
// it returns. Registry failures are answered as HRESULT_FROM_WIN32 of the registry's code.
#pragma once

#include <ut/platform/registry.h>
#include <ut/sdk/export.h>

// Writes into `buffer` the key text of `subKey` in the host's core branch (under
// HKEY_LOCAL_MACHINE): "Software\ut\Core\<subKey>", or "Software\ut\Core" for an empty or null
// sub-key. E_POINTER for a null buffer, E_INVALIDARG for a capacity below 1, and
// HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER) with an empty buffer when `capacity` characters
// do not hold the text and its terminator.
UT_SDK_API HRESULT GWConstructKxcoreRegKey(const wchar_t* subKey, wchar_t* buffer, int capacity);

// Enters `clsid` as an in-process class of `module` under `name`, writing over what was there;
// the writes reach the disk together where the registry has transactions. E_INVALIDARG for
// GUID_NULL or a module whose file name is unknown, E_POINTER for a null name.
UT_SDK_API HRESULT GWRegisterCOMObject(REFCLSID clsid, HINSTANCE module, const wchar_t* name);
// Removes the class's key with everything below it: S_OK, or S_FALSE when it was not there.
UT_SDK_API HRESULT GWUnregisterCOMObject(REFCLSID clsid);

// Drops the key `subKey` of `root` when it holds neither values nor sub-keys, then each of its
// parents that is left empty, up to and including the category: the first key below a module's
// key (GWResourceConstructRegKey). A module's key itself and the keys above it always stay; a key
// outside the modules' branch is dropped alone, without its parents. S_OK when `subKey` was
// dropped, S_FALSE when it holds something or is not there.
UT_SDK_API HRESULT GwRegCleanKey(HKEY root, const wchar_t* subKey);

// Deletes the key `subKey` of the open key `parent` with every key below it. E_INVALIDARG for a
// null or empty sub-key (which would name the parent itself);
// HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND) when it is not there.
UT_SDK_API HRESULT GWRegDeleteKey(HKEY parent, const wchar_t* subKey);
