// Registry tests on both homes work under a scratch key of their own,
// HKEY_CURRENT_USER\Software\ut-tests\<random>, deleted with everything below it at the end. On
// POSIX the test program first gets a private store in the temporary folder, removed at exit.
#pragma once

#include <string>

#include <ut/platform/registry.h>

namespace ut::test {

class ScratchKey {
public:
    ScratchKey();
    ~ScratchKey() {
        (void)RegDeleteTreeW(HKEY_CURRENT_USER, subKey_.c_str());
    } // a key left over harms no test
    ScratchKey(const ScratchKey&) = delete;
    ScratchKey& operator=(const ScratchKey&) = delete;

    // Open with all access; null when it could not be created.
    HKEY Get() const { return key_.get(); }
    // Its path below HKEY_CURRENT_USER, and with the root's name.
    const std::wstring& SubKey() const { return subKey_; }
    std::wstring FullPath() const { return L"HKEY_CURRENT_USER\\" + subKey_; }

private:
    std::wstring subKey_;
    UniqueHKey key_;
};

} // namespace ut::test
