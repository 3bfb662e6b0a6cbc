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

// The texts of string dictionaries: dictionary <name> is read on first use from "<name>.dict" in
// "../share/ut" beside the module registered under the name, or beside this library (see
// KXDictLoadFile for the format). The returned text stays valid for the life of the process; an
// entry or dictionary that does not exist gives an empty text.
UT_SDK_API const wchar_t* DictLoadIdstring(const wchar_t* dictionary, unsigned short id);
// Reads dictionary `name` from the file `path`, replacing what was read before. The file is UTF-8
// text, one entry a line: a decimal number, blanks, and the text to the end of the line, where
// \n, \t and \\ stand for a line break, a tab and a backslash (any other backslash is itself).
// Blank lines, lines starting with '#' and lines that do not start with a number are skipped; a
// number given twice keeps its last text. E_INVALIDARG for a null path or an empty name; the failure to read
// the file otherwise.
UT_SDK_API HRESULT KXDictLoadFile(const wchar_t* name, const wchar_t* path);

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
// The text `id` of `module`: from the string table the module gave, else from the dictionary the
// module registered; the empty text when neither has it. A text handed out stays valid for the
// life of the process, even after it is replaced.
UT_SDK_API const wchar_t* KXDictLoadInstanceIdstring(HINSTANCE module, unsigned int id);
