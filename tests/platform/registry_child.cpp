// A second process for the POSIX registry tests and the interoperation check with the system's
// registry editor: it writes, probes, exports and imports the store that UT_REGISTRY names.
//
//   registry_child write KEY COUNT       creates HKCU\KEY\key<i> with a default value, printing i
//                                        once each key is in
//   registry_child probe KEY             as an unprivileged user: tries a read and three writes
//                                        below HKCU\KEY and prints their codes
//   registry_child populate KEY          writes values of every type below HKCU\KEY
//   registry_child export KEY FILE       exports HKCU\KEY to FILE
//   registry_child import FILE           imports FILE
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <string>
#include <unistd.h>

#include <ut/platform/regfile.h>

#include "registry_helpers.h"

namespace {

using namespace ut::test;

std::wstring Wide(const char* text) {
    return ut::platform::WideFromUtf8(text);
}

int Write(const std::wstring& parent, long count) {
    for (long i = 0; i < count; ++i) {
        std::wstring path = parent + L"\\key" + std::to_wstring(i);
        // The key and its value land together.
        ut::platform::RegistryTransaction transaction;
        ut::UniqueHKey key = CreateKey(HKEY_CURRENT_USER, path);
        LONG result =
            key ? SetText(key.get(), nullptr, L"value " + std::to_wstring(i)) : ERROR_FILE_NOT_FOUND;
        if (result == ERROR_SUCCESS)
            result = transaction.Commit();
        if (result != ERROR_SUCCESS) {
            std::printf("error %ld at %ld\n", static_cast<long>(result), i);
            return 1;
        }
        std::printf("%ld\n", i);
        std::fflush(stdout);
    }
    return 0;
}

// Drops root's rights first, so that file permissions apply as they do to a user.
int Probe(const std::wstring& path) {
    constexpr uid_t kNobody = 65534;
    if (geteuid() == 0 && (setgid(kNobody) != 0 || setuid(kNobody) != 0)) {
        std::printf("cannot drop privileges\n");
        return 1;
    }
    ut::UniqueHKey key = OpenKey(HKEY_CURRENT_USER, path, KEY_ALL_ACCESS);
    HKEY created = nullptr;
    std::printf("read=%ld create=%ld set=%ld delete=%ld\n",
                static_cast<long>(QueryValue(key.get(), L"v").result),
                static_cast<long>(RegCreateKeyExW(key.get(), L"new", 0, nullptr, 0, KEY_ALL_ACCESS, nullptr,
                                                  &created, nullptr)),
                static_cast<long>(SetText(key.get(), L"v", L"changed")),
                static_cast<long>(RegDeleteValueW(key.get(), L"v")));
    return 0;
}

int Populate(const std::wstring& path) {
    ut::UniqueHKey key = CreateKey(HKEY_CURRENT_USER, path);
    ut::UniqueHKey sub = CreateKey(HKEY_CURRENT_USER, path + L"\\sub key \"q\" \u00c4\\deeper");
    if (!key || !sub)
        return 1;
    Bytes binary(200);
    for (std::size_t i = 0; i < binary.size(); ++i)
        binary[i] = static_cast<BYTE>(i * 13);
    LONG results[] = {
        SetText(key.get(), nullptr, L"the default"),
        SetText(key.get(), L"with space", L"a \"quoted\" \\ back\\slash"),
        SetText(key.get(), L"\u00c4pfel \u00e9t\u00e9", L"\u00df \u4e2d \U0001F3AC"),
        SetValue(key.get(), L"expand", REG_EXPAND_SZ, TextBytes(L"%PATH%;\u00e9")),
        SetValue(key.get(), L"multi", REG_MULTI_SZ, MultiBytes({L"one", L"two", L"\u00c4"})),
        SetValue(key.get(), L"dword", REG_DWORD, LittleEndian(0xDEADBEEF, 4)),
        SetValue(key.get(), L"qword", REG_QWORD, LittleEndian(0x0102030405060708, 8)),
        SetValue(key.get(), L"binary", REG_BINARY, binary),
        SetValue(key.get(), L"none", REG_NONE, Bytes{}),
        SetValue(sub.get(), L"quote \" and back\\slash", REG_BINARY, Bytes{1, 2, 3}),
    };
    for (LONG result : results)
        if (result != ERROR_SUCCESS)
            return 1;
    return 0;
}

int Export(const std::wstring& path, const char* file) {
    std::string bytes;
    LONG result = ut::platform::ExportRegFile((L"HKEY_CURRENT_USER\\" + path).c_str(), bytes);
    if (result != ERROR_SUCCESS) {
        std::fprintf(stderr, "export failed: %ld\n", static_cast<long>(result));
        return 1;
    }
    std::ofstream(file, std::ios::binary) << bytes;
    return 0;
}

int Import(const char* file) {
    std::ifstream in(file, std::ios::binary);
    std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    ut::platform::RegFileProblem problem;
    LONG result = ut::platform::ImportRegFile(bytes.data(), bytes.size(), &problem);
    if (result != ERROR_SUCCESS) {
        std::fprintf(stderr, "import failed: %ld at line %u: %s\n", static_cast<long>(result), problem.line,
                     Narrow(problem.message).c_str());
        return 1;
    }
    return 0;
}

} // namespace

int main(int argc, char** argv) {
    std::string command = argc > 1 ? argv[1] : "";
    if (command == "write" && argc == 4)
        return Write(Wide(argv[2]), std::strtol(argv[3], nullptr, 10));
    if (command == "probe" && argc == 3)
        return Probe(Wide(argv[2]));
    if (command == "populate" && argc == 3)
        return Populate(Wide(argv[2]));
    if (command == "export" && argc == 4)
        return Export(Wide(argv[2]), argv[3]);
    if (command == "import" && argc == 3)
        return Import(argv[2]);
    std::fprintf(stderr, "usage: registry_child write|probe|populate|export|import ...\n");
    return 2;
}
