// Scratch registry keys and the test program's private store.
#include "registry_scratch.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <random>

namespace ut::test {
namespace {

std::string RandomHex() {
    std::random_device device;
    std::uint64_t bits = (static_cast<std::uint64_t>(device()) << 32) ^ device();
    char text[17];
    std::snprintf(text, sizeof text, "%016llx", static_cast<unsigned long long>(bits));
    return text;
}

std::string& StorePath() {
    static std::string path;
    return path;
}

void RemoveStoreFiles() {
    for (const char* suffix : {"", "-wal", "-shm", "-changes"})
        std::remove((StorePath() + suffix).c_str());
}

} // namespace

void UsePrivateRegistryStore() {
    if (!StorePath().empty())
        return;
    StorePath() = (std::filesystem::temp_directory_path() / ("ut-registry-" + RandomHex() + ".db")).string();
    // putenv keeps the text it is given, so it lives as long as the process.
    static std::string assignment = "UT_REGISTRY=" + StorePath();
    putenv(assignment.data());
    std::atexit(&RemoveStoreFiles);
}

const std::string& PrivateRegistryStorePath() {
    return StorePath();
}

ScratchKey::ScratchKey() {
    UsePrivateRegistryStore();
    std::string name = RandomHex();
    subKey_ = L"Software\\ut-tests\\" + std::wstring(name.begin(), name.end());
    HKEY key = nullptr;
    if (RegCreateKeyExW(HKEY_CURRENT_USER, subKey_.c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE,
                        KEY_ALL_ACCESS, nullptr, &key, nullptr) == ERROR_SUCCESS)
        key_.reset(key);
}

ScratchKey::~ScratchKey() {
    key_.reset();
    (void)RegDeleteTreeW(HKEY_CURRENT_USER, subKey_.c_str()); // a scratch key left behind harms no test
}

} // namespace ut::test
