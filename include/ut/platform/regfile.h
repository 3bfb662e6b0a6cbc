// Registry files in the standard ".reg" text form, on both homes: a key exported with everything
// below it, and a file imported in one piece. Both work through the registry calls, so a file
// written here reads in the system's registry editor and the other way round.
#pragma once

#include <cstddef>
#include <string>

#include <ut/platform/registry.h>

namespace ut::platform {

// Why an import was refused or stopped: the line of the input it concerns (counted from 1; 0 when
// it concerns the input as a whole) and what is wrong there.
struct RegFileProblem {
    unsigned line = 0;
    std::wstring message;
};

// Opens the key `keyPath`: a root, HKEY_LOCAL_MACHINE, HKEY_CLASSES_ROOT or HKEY_CURRENT_USER, or
// their short forms HKLM, HKCR and HKCU, then the sub-key path after a backslash. An unknown root
// answers ERROR_BAD_PATHNAME; other answers are RegOpenKeyExW's.
UT_PLATFORM_API LONG OpenKeyPath(const wchar_t* keyPath, REGSAM access, HKEY* key);

// Writes the key `keyPath` (named as for OpenKeyPath) with its values and every key below it, as
// the bytes of a ".reg" file: UTF-16LE with a byte-order mark, the
// header "Windows Registry Editor Version 5.00", lines ending in CR LF, each key followed by its
// values in enumeration order and then its sub-keys. Text values that are one terminated string
// without control characters are written quoted; REG_DWORD values of 4 bytes as dword:; every other
// value as hex: (REG_BINARY) or hex(type):, wrapped at 80 columns, so that it reads back byte for
// byte. A missing key answers ERROR_FILE_NOT_FOUND; other failures are the registry's.
UT_PLATFORM_API LONG ExportRegFile(const wchar_t* keyPath, std::string& bytes);

// Applies the bytes of a ".reg" file: UTF-8 (with or without a byte-order mark) or UTF-16 (with
// one), first line "Windows Registry Editor Version 5.00". "[key]" creates a key and makes it the
// one the following values go to, "[-key]" deletes a key with everything below it; "name"=data
// and @=data (the default value) set a value, "name"=- deletes one. Data is "text" (REG_SZ; the
// escapes \\, \", \n, \r and \0), dword:hexdigits, hex:bytes (REG_BINARY) or hex(type):bytes, the
// bytes as two-digit hexadecimal numbers between commas, continued on the next line after a
// trailing backslash. Lines starting with ';' are comments.
// The whole input is read before anything is written: malformed input answers ERROR_INVALID_DATA,
// says where in `problem`, and changes nothing. Everything is then written in one registry
// transaction: on POSIX it all lands or none of it does; on Windows a failure part way leaves what
// was already written. Deleting what is not there is not a failure.
UT_PLATFORM_API LONG ImportRegFile(const void* bytes, std::size_t size, RegFileProblem* problem);

} // namespace ut::platform
