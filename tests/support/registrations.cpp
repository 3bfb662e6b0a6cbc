// Clearing the registry between registration tests, and reading keys back as ".reg" text.
#include "support/registrations.h"

#include <vector>

#include <ut/detail/names.h>
#include <ut/platform/process.h>
#include <ut/platform/regfile.h>
#include <ut/platform/text.h>
#include <ut/sdk/resources.h>

#include "support/registry_scratch.h"

namespace ut::test {
namespace {

constexpr USHORT kTestField = 0x7E57;

void DeleteTree(HKEY root, const wchar_t* path) {
    (void)RegDeleteTreeW(root, path); // a tree that is not there is already clear
}

} // namespace

GUID TestGuid(ULONG n) {
    return {n, kTestField, kTestField, {0x80, 0, 0, 0, 0, 0, 0, 0}};
}

void ClearRegistrations() {
    UsePrivateRegistryStore();
    DeleteTree(HKEY_LOCAL_MACHINE, L"Software\\ut");
    DeleteTree(HKEY_CURRENT_USER, L"Software\\ut");
    DeleteTree(HKEY_CLASSES_ROOT, L"QVX");
    DeleteTree(HKEY_CLASSES_ROOT, L"UtTest.Twist");
    HKEY classes = nullptr;
    if (RegOpenKeyExW(HKEY_CLASSES_ROOT, L"CLSID", 0, KEY_READ, &classes) != ERROR_SUCCESS)
        return;
    UniqueHKey owned(classes);
    std::vector<std::wstring> tests;
    wchar_t name[256];
    for (DWORD index = 0;; ++index) {
        DWORD length = 256;
        if (RegEnumKeyExW(classes, index, name, &length, nullptr, nullptr, nullptr, nullptr) != ERROR_SUCCESS)
            break;
        GUID id{};
        if (SUCCEEDED(ParseGuid(name, &id)) && id.Data2 == kTestField && id.Data3 == kTestField)
            tests.emplace_back(name);
    }
    for (const std::wstring& test : tests)
        DeleteTree(classes, test.c_str());
}

RegistrationScope::RegistrationScope() {
    ClearRegistrations();
}

RegistrationScope::~RegistrationScope() {
    ClearRegistrations();
}

HINSTANCE TestModule() {
    return platform::ModuleOf(reinterpret_cast<const void*>(&TestModule));
}

std::wstring ExportedText(const std::wstring& keyPath) {
    std::string bytes;
    if (LONG result = platform::ExportRegFile(keyPath.c_str(), bytes); result != ERROR_SUCCESS)
        return L"<error " + std::to_wstring(result) + L">";
    constexpr std::size_t kByteOrderMark = 2;
    if (bytes.size() < kByteOrderMark)
        return L"<empty>";
    return platform::WideFromUtf16Le(reinterpret_cast<const std::uint8_t*>(bytes.data()) + kByteOrderMark,
                                     (bytes.size() - kByteOrderMark) / 2);
}

std::wstring LibraryBaseKey() {
    wchar_t key[kPathCapacity] = L"";
    (void)GWResourceConstructRegKey(KXDictFindInstance(kDictionaryName), L"", key,
                                    kPathCapacity); // empty says it
    return key;
}

std::wstring RegQuoted(const std::wstring& text) {
    std::wstring quoted;
    for (wchar_t c : text) {
        if (c == L'\\' || c == L'"')
            quoted.push_back(L'\\');
        quoted.push_back(c);
    }
    return quoted;
}

} // namespace ut::test
