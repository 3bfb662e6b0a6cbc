// The application's resource services: the registry key of a module, the string dictionaries
// that modules register under a name, and the string tables of modules.
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

// One entry of a module's string table.
struct KXDictString {
    unsigned int id;
    const wchar_t* text;
};

// Gives `module` the texts of a string table, copied: an entry replaces an earlier text of its
// id, and the module keeps its other texts. E_INVALIDARG for a null module, E_POINTER for a null
// table with a non-zero count or an entry with a null text (then nothing is taken).
UT_SDK_API HRESULT KXDictAddInstanceStrings(HINSTANCE module, const KXDictString* strings,
                                            unsigned int count);
// The text `id` of the string table of `module`: the empty text when the module gave none of that
// id. A text handed out stays valid for the life of the process, even after it is replaced.
UT_SDK_API const wchar_t* KXDictLoadInstanceIdstring(HINSTANCE module, unsigned int id);
