// Imports arbitrary bytes as a ".reg" file into a private store in memory. Nothing may crash, and
// whatever an import writes must export, import again and export to the same bytes.
#include <array>
#include <cstdint>
#include <cstdlib>
#include <string>

#include <ut/platform/regfile.h>

namespace {

constexpr const wchar_t* kRoots[] = {L"HKEY_LOCAL_MACHINE", L"HKEY_CLASSES_ROOT", L"HKEY_CURRENT_USER"};
using Exports = std::array<std::string, 3>;

void Clear() {
    for (HKEY root : {HKEY_LOCAL_MACHINE, HKEY_CLASSES_ROOT, HKEY_CURRENT_USER})
        (void)RegDeleteTreeW(root, nullptr); // the next export shows anything left behind
}

Exports ExportAll() {
    Exports exports;
    for (std::size_t i = 0; i < exports.size(); ++i)
        if (ut::platform::ExportRegFile(kRoots[i], exports[i]) != ERROR_SUCCESS)
            std::abort();
    return exports;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    // The store lives in memory: set before the first registry call opens it.
    static const bool inMemory = setenv("UT_REGISTRY", ":memory:", 1) == 0;
    if (!inMemory)
        std::abort();
    Clear();
    if (ut::platform::ImportRegFile(data, size, nullptr) != ERROR_SUCCESS)
        return 0;
    Exports first = ExportAll();
    Clear();
    for (const std::string& bytes : first)
        if (ut::platform::ImportRegFile(bytes.data(), bytes.size(), nullptr) != ERROR_SUCCESS)
            std::abort();
    if (ExportAll() != first)
        std::abort();
    return 0;
}
