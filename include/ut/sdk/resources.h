// The application's resource services: the registry key of a module, and the string
// dictionaries that modules register under a name.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// Writes the registry key text of `module` (under HKEY_LOCAL_MACHINE) followed by `subKey`:
// "Software\ut\Modules\<module>\<subKey>", where <module> is the module's file name without
// directory, extension and a leading "lib". The text always ends in a backslash.
// Returns 0 on success; ERROR_INVALID_PARAMETER for a null or unknown module or buffer, and
// ERROR_INSUFFICIENT_BUFFER (leaving the buffer empty) when `capacity` characters do not hold it.
UT_SDK_API LONG GWResourceConstructRegKey(HINSTANCE module, const wchar_t* subKey, wchar_t* buffer,
                                          int capacity);

// Registers `module` as the owner of the string dictionary `name`. Registering the same name
// again replaces its module. E_INVALIDARG for a null module or an empty name.
UT_SDK_API HRESULT KXDictRegisterInstance(HINSTANCE module, const wchar_t* name);
UT_SDK_API HRESULT KXDictUnregisterInstance(const wchar_t* name);
// The module registered under `name`, or null.
UT_SDK_API HINSTANCE KXDictFindInstance(const wchar_t* name);
