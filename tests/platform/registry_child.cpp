// A second process for the POSIX registry tests and for the check against the system's registry
// editor, on the store that UT_REGISTRY names:
//   write KEY COUNT     prints its process id, then creates HKCU\KEY\key<i> with a default value
//                       and prints i once each key is in
//   probe KEY           as an unprivileged user: a read and three writes below HKCU\KEY, and
//                       their codes
//   populate KEY        every kind of value that any registry editor carries, below HKCU\KEY
//   export KEY FILE     HKCU\KEY to FILE
//   import FILE         FILE
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

int Write(const std::wstring& parent, long count) {
    std::printf("%ld\n", static_cast<long>(getpid()));
    for (long i = 0; i < count; ++i) {
        ut::platform::RegistryTransaction transaction; // the key and its value land together
        ut::UniqueHKey key = CreateKey(HKEY_CURRENT_USER, parent + L"\\key" + std::to_wstring(i));
        LONG result =
            key ? SetText(key.get(), nullptr, L"value " + std::to_wstring(i)) : ERROR_FILE_NOT_FOUND;
        if (result != ERROR_SUCCESS || (result = transaction.Commit()) != ERROR_SUCCESS)
            return std::printf("error %ld\n", static_cast<long>(result)), 1;
        std::printf("%ld\n", i);
        std::fflush(stdout);
    }
    return 0;
}

int Probe(const std::wstring& path) {
    // Root is let through whatever a file's permissions say: drop to nobody first.
    constexpr uid_t kNobody = 65534;
    if (geteuid() == 0 && (setgid(kNobody) != 0 || setuid(kNobody) != 0))
        return std::printf("cannot drop privileges\n"), 1;
    ut::UniqueHKey key = OpenKey(HKEY_CURRENT_USER, path, KEY_ALL_ACCESS);
    HKEY created = nullptr;
    long results[] = {
        QueryValue(key.get(), L"v").result,
        RegCreateKeyExW(key.get(), L"new", 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &created, nullptr),
        SetText(key.get(), L"v", L"changed"), RegDeleteValueW(key.get(), L"v")};
    std::printf("read=%ld create=%ld set=%ld delete=%ld\n", results[0], results[1], results[2], results[3]);
    return 0;
}

int Populate(const std::wstring& path) {
    ut::UniqueHKey key = CreateKey(HKEY_CURRENT_USER, path);
    ut::UniqueHKey deeper = CreateKey(HKEY_CURRENT_USER, path + L"\\sub key \"q\" \u00c4\\deeper");
    for (const Sample& sample : EveryKindOfValue())
        if (sample.anyEditor &&
            (SetValue(key.get(), sample.name, sample.type, sample.data) != ERROR_SUCCESS ||
             SetValue(deeper.get(), sample.name, sample.type, sample.data) != ERROR_SUCCESS))
            return 1;
    return 0;
}

int Export(const std::wstring& path, const char* file) {
    std::string bytes;
    LONG result = ut::platform::ExportRegFile((L"HKEY_CURRENT_USER\\" + path).c_str(), bytes);
    if (result != ERROR_SUCCESS)
        return std::fprintf(stderr, "export failed: %ld\n", static_cast<long>(result)), 1;
    std::ofstream(file, std::ios::binary) << bytes;
    return 0;
}

int Import(const char* file) {
    std::ifstream in(file, std::ios::binary);
    std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    ut::platform::RegFileProblem problem;
    LONG result = ut::platform::ImportRegFile(bytes.data(), bytes.size(), &problem);
    if (result != ERROR_SUCCESS)
        return std::fprintf(stderr, "import failed: %ld at line %u: %s\n", static_cast<long>(result),
                            problem.line, Narrow(problem.message).c_str()),
               1;
    return 0;
}

} // namespace

int main(int argc, char** argv) {
    std::string command = argc > 1 ? argv[1] : "";
    std::wstring key = argc > 2 ? ut::platform::WideFromUtf8(argv[2]) : std::wstring();
    if (command == "write" && argc == 4)
        return Write(key, std::strtol(argv[3], nullptr, 10));
    if (command == "probe" && argc == 3)
        return Probe(key);
    if (command == "populate" && argc == 3)
        return Populate(key);
    if (command == "export" && argc == 4)
        return Export(key, argv[3]);
    if (command == "import" && argc == 3)
        return Import(argv[2]);
    std::fprintf(stderr, "usage: registry_child write|probe|populate|export|import ...\n");
    return 2;
}
