// Registration tests on both homes start and end with none of what registration writes: the
// library's and the reference host's branches (HKEY_LOCAL_MACHINE and HKEY_CURRENT_USER
// "Software\ut"), the "QVX" branch and the test classes of HKEY_CLASSES_ROOT. On POSIX the test
// program works on a private store file.
#pragma once

#include <string>

#include <ut/platform/com.h>

namespace ut::test {

// Test class number `n`: {NNNNNNNN-7E57-7E57-8000-000000000000}, told apart from every other
// class by its middle fields.
GUID TestGuid(ULONG n);

// Removes everything registration tests may have written.
void ClearRegistrations();

// Clears on construction and destruction.
class RegistrationScope {
public:
    RegistrationScope();
    ~RegistrationScope();
    RegistrationScope(const RegistrationScope&) = delete;
    RegistrationScope& operator=(const RegistrationScope&) = delete;
};

// The test program's own module, registering as a plug-in would.
HINSTANCE TestModule();

// The ".reg" export of `keyPath` as text (without its byte-order mark), or "<error N>".
std::wstring ExportedText(const std::wstring& keyPath);

// The library's registry base key below HKEY_LOCAL_MACHINE, ending in a backslash.
std::wstring LibraryBaseKey();

// `text` with backslashes and quotes escaped as a ".reg" file quotes it.
std::wstring RegQuoted(const std::wstring& text);

} // namespace ut::test
