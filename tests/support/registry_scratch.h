// Registry tests on both homes work under a scratch key of their own,
// HKEY_CURRENT_USER\Software\ut-tests\<random>, which goes with everything below it when the test
// ends. On POSIX the test program gets a private store file in the temporary folder, removed at
// exit; the system's registry has no use for it.
#pragma once

#include <string>

#include <ut/platform/registry.h>

namespace ut::test {

// Points UT_REGISTRY at a fresh file for the rest of the process, unless it was done already.
// Must run before the first registry call of the process.
void UsePrivateRegistryStore();

// The store file UsePrivateRegistryStore chose.
const std::string& PrivateRegistryStorePath();

class ScratchKey {
public:
    ScratchKey();
    ~ScratchKey();
    ScratchKey(const ScratchKey&) = delete;
    ScratchKey& operator=(const ScratchKey&) = delete;

    // Open with all access; null when the key could not be created.
    HKEY Get() const { return key_.get(); }
    // The key's path below HKEY_CURRENT_USER, and its full path with the root's name.
    const std::wstring& SubKey() const { return subKey_; }
    std::wstring FullPath() const { return L"HKEY_CURRENT_USER\\" + subKey_; }

private:
    std::wstring subKey_;
    UniqueHKey key_;
};

} // namespace ut::test
