// The registry workloads: populating, walking and churning keys through the registry calls.
#include "registry_workloads.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <optional>
#include <random>

namespace ut::bench {
namespace {

std::string RandomHex() {
    std::random_device device;
    char text[17];
    std::snprintf(text, sizeof text, "%08x%08x", device(), device());
    return text;
}

std::string& StorePath() {
    static std::string path;
    return path;
}

void RemoveStore() {
    for (const char* suffix : {"", "-wal", "-shm", "-changes"})
        std::remove((StorePath() + suffix).c_str());
}

std::wstring KeyName(int n) {
    return L"key" + std::to_wstring(n);
}

void Check(LONG result, const char* what) {
    if (result == ERROR_SUCCESS)
        return;
    std::fprintf(stderr, "%s failed: %ld\n", what, static_cast<long>(result));
    std::exit(1);
}

} // namespace

void UsePrivateStore() {
    StorePath() =
        (std::filesystem::temp_directory_path() / ("ut-bench-registry-" + RandomHex() + ".db")).string();
    static std::string assignment = "UT_REGISTRY=" + StorePath();
    putenv(assignment.data());
    std::atexit(&RemoveStore);
}

BenchKey::BenchKey() {
    std::string name = RandomHex();
    path_ = L"Software\\ut-bench\\" + std::wstring(name.begin(), name.end());
    HKEY key = nullptr;
    Check(RegCreateKeyExW(HKEY_CURRENT_USER, path_.c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE,
                          KEY_ALL_ACCESS, nullptr, &key, nullptr),
          "creating the benchmark's key");
    key_.reset(key);
}

BenchKey::~BenchKey() {
    key_.reset();
    (void)RegDeleteTreeW(HKEY_CURRENT_USER, path_.c_str()); // a left-over key only costs space
}

void Populate(HKEY parent, int count) {
    platform::RegistryTransaction transaction;
    Check(transaction.Status(), "beginning a transaction");
    static const wchar_t kDefault[] = L"{1C36C8C0-A6A4-11D3-B4B3-00A0244EEB76}";
    for (int n = 0; n < count; ++n) {
        HKEY key = nullptr;
        Check(RegCreateKeyExW(parent, KeyName(n).c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE,
                              KEY_READ | KEY_WRITE, nullptr, &key, nullptr),
              "creating a key");
        UniqueHKey owned(key);
        std::wstring name = L"Object class number " + std::to_wstring(n);
        Check(
            RegSetValueExW(key, nullptr, 0, REG_SZ, reinterpret_cast<const BYTE*>(kDefault), sizeof kDefault),
            "setting a default value");
        Check(RegSetValueExW(key, L"Name", 0, REG_SZ, reinterpret_cast<const BYTE*>(name.c_str()),
                             static_cast<DWORD>((name.size() + 1) * sizeof(wchar_t))),
              "setting a name");
    }
    Check(transaction.Commit(), "committing");
}

int EnumerateAndRead(HKEY parent) {
    wchar_t child[256];
    wchar_t name[256];
    int read = 0;
    for (DWORD index = 0;; ++index) {
        DWORD length = 256;
        LONG result = RegEnumKeyExW(parent, index, child, &length, nullptr, nullptr, nullptr, nullptr);
        if (result == ERROR_NO_MORE_ITEMS)
            return read;
        Check(result, "listing a key");
        HKEY key = nullptr;
        Check(RegOpenKeyExW(parent, child, 0, KEY_READ, &key), "opening a key");
        UniqueHKey owned(key);
        DWORD type = 0, size = sizeof name;
        Check(RegQueryValueExW(key, L"Name", nullptr, &type, reinterpret_cast<BYTE*>(name), &size),
              "reading");
        ++read;
    }
}

void CreateAndDelete(HKEY parent, int count, bool batched) {
    std::optional<platform::RegistryTransaction> transaction;
    if (batched)
        Check(transaction.emplace().Status(), "beginning a transaction");
    for (int n = 0; n < count; ++n) {
        HKEY key = nullptr;
        Check(RegCreateKeyExW(parent, KeyName(n).c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS,
                              nullptr, &key, nullptr),
              "creating a key");
        Check(RegCloseKey(key), "closing a key");
    }
    for (int n = 0; n < count; ++n)
        Check(RegDeleteKeyW(parent, KeyName(n).c_str()), "deleting a key");
    if (transaction)
        Check(transaction->Commit(), "committing");
}

} // namespace ut::bench
