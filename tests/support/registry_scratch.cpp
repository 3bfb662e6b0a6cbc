// Scratch registry keys, and the test program's private store.
#include "registry_scratch.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <random>

namespace ut::test {
namespace {

std::string RandomHex() {
    std::random_device device;
    char text[17];
    std::snprintf(text, sizeof text, "%08x%08x", device(), device());
    return text;
}

// UT_REGISTRY names a fresh file for the rest of the process (read when the store first opens;
// the system's registry ignores it). putenv keeps the text it is given.
void UsePrivateStore() {
    static std::string assignment;
    if (!assignment.empty())
        return;
    assignment = "UT_REGISTRY=" +
                 (std::filesystem::temp_directory_path() / ("ut-registry-" + RandomHex() + ".db")).string();
    putenv(assignment.data());
    std::atexit([] {
        for (const char* suffix : {"", "-wal", "-shm", "-changes"})
            std::remove((assignment.substr(12) + suffix).c_str());
    });
}

} // namespace

ScratchKey::ScratchKey() {
    UsePrivateStore();
    std::string name = RandomHex();
    subKey_ = L"Software\\ut-tests\\" + std::wstring(name.begin(), name.end());
    HKEY key = nullptr;
    (void)RegCreateKeyExW(HKEY_CURRENT_USER, subKey_.c_str(), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key,
                          nullptr); // Get() answers null then
    key_.reset(key);
}

} // namespace ut::test
