// ut registry: read a key, and move keys in and out as ".reg" files, on the registry the library
// uses (on POSIX the store that UT_REGISTRY names; on Windows the system's registry).
//
//   ut registry list [CATEGORY]     the classes of the library's categories (registry_list.cpp)
//   ut registry get KEY [NAME]       the values and sub-keys of KEY, or the data of one value
//   ut registry export KEY FILE.reg  KEY with everything below it
//   ut registry import FILE.reg      all of the file, or nothing of it
#include <CLI/CLI.hpp>

#include <cstdio>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include <ut/platform/regfile.h>
#include <ut/platform/text.h>

#include "commands.h"

namespace ut::tool {
namespace {

std::string Narrow(const std::wstring& text) {
    return platform::Utf8FromWide(text);
}

// Ends the command with one line that says what failed: a key or value that is not there is the
// answer "no" (1); anything else is input the command could not use (2).
[[noreturn]] void RegistryFailed(const std::string& what, LONG code) {
    ut::tool::Fail(code == ERROR_FILE_NOT_FOUND ? kExitNo : kExitUsage,
                   "registry: " + what + " (error " + std::to_string(code) + ")");
}

const char* TypeName(DWORD type) {
    switch (type) {
    case REG_NONE:
        return "REG_NONE";
    case REG_SZ:
        return "REG_SZ";
    case REG_EXPAND_SZ:
        return "REG_EXPAND_SZ";
    case REG_BINARY:
        return "REG_BINARY";
    case REG_DWORD:
        return "REG_DWORD";
    case REG_MULTI_SZ:
        return "REG_MULTI_SZ";
    case REG_QWORD:
        return "REG_QWORD";
    default:
        return "REG_(other)";
    }
}

// The data as a person reads it: text as text (the strings of a REG_MULTI_SZ between " | "),
// numbers in hexadecimal and decimal, and everything else as hexadecimal bytes.
std::string Describe(DWORD type, const std::vector<BYTE>& data) {
    if (type == REG_SZ || type == REG_EXPAND_SZ || type == REG_MULTI_SZ) {
        std::wstring text(data.size() / sizeof(wchar_t), L'\0');
        std::copy(data.begin(), data.begin() + static_cast<std::ptrdiff_t>(text.size() * sizeof(wchar_t)),
                  reinterpret_cast<BYTE*>(text.data()));
        while (!text.empty() && text.back() == L'\0')
            text.pop_back();
        std::string out;
        for (wchar_t c : text)
            out += c == L'\0' ? std::string(" | ") : Narrow(std::wstring(1, c));
        return out;
    }
    if ((type == REG_DWORD && data.size() == 4) || (type == REG_QWORD && data.size() == 8)) {
        unsigned long long value = 0;
        for (std::size_t i = data.size(); i-- > 0;)
            value = (value << 8) | data[i];
        char text[64];
        std::snprintf(text, sizeof text, "0x%0*llx (%llu)", static_cast<int>(data.size() * 2), value, value);
        return text;
    }
    std::string out;
    for (BYTE byte : data) {
        char text[4];
        std::snprintf(text, sizeof text, out.empty() ? "%02x" : " %02x", byte);
        out += text;
    }
    return out;
}

UniqueHKey Open(const std::string& path) {
    HKEY key = nullptr;
    LONG result = platform::OpenKeyPath(platform::WideFromUtf8(path).c_str(), KEY_READ, &key);
    if (result != ERROR_SUCCESS)
        RegistryFailed("cannot open " + path, result);
    return UniqueHKey(key);
}

void Get(const std::string& path, const std::string& valueName, bool oneValue) {
    UniqueHKey key = Open(path);
    DWORD longestName = 0, largest = 0;
    LONG result = RegQueryInfoKeyW(key.get(), nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                                   &longestName, &largest, nullptr, nullptr);
    if (result != ERROR_SUCCESS)
        RegistryFailed("cannot read " + path, result);
    std::vector<BYTE> data(largest);
    if (oneValue) {
        DWORD type = REG_NONE, size = largest;
        result = RegQueryValueExW(key.get(), platform::WideFromUtf8(valueName).c_str(), nullptr, &type,
                                  data.data(), &size);
        if (result != ERROR_SUCCESS)
            RegistryFailed("cannot read the value \"" + valueName + "\" of " + path, result);
        data.resize(size);
        std::printf("%s\n", Describe(type, data).c_str());
        return;
    }
    std::printf("%s\n", path.c_str());
    std::wstring name(longestName + 1, L'\0');
    for (DWORD index = 0;; ++index) {
        DWORD nameLength = longestName + 1, type = REG_NONE, size = largest;
        result =
            RegEnumValueW(key.get(), index, name.data(), &nameLength, nullptr, &type, data.data(), &size);
        if (result == ERROR_NO_MORE_ITEMS)
            break;
        if (result != ERROR_SUCCESS)
            RegistryFailed("cannot list the values of " + path, result);
        std::string shown = nameLength ? Narrow(name.substr(0, nameLength)) : "(default)";
        std::printf("  %-24s %-13s %s\n", shown.c_str(), TypeName(type),
                    Describe(type, std::vector<BYTE>(data.begin(), data.begin() + size)).c_str());
    }
    wchar_t subKey[256];
    for (DWORD index = 0;; ++index) {
        DWORD length = 256;
        result = RegEnumKeyExW(key.get(), index, subKey, &length, nullptr, nullptr, nullptr, nullptr);
        if (result == ERROR_NO_MORE_ITEMS)
            break;
        if (result != ERROR_SUCCESS)
            RegistryFailed("cannot list the sub-keys of " + path, result);
        std::printf("  [%s]\n", Narrow(std::wstring(subKey, length)).c_str());
    }
}

void Export(const std::string& path, const std::string& file) {
    std::string bytes;
    LONG result = platform::ExportRegFile(platform::WideFromUtf8(path).c_str(), bytes);
    if (result != ERROR_SUCCESS)
        RegistryFailed("cannot export " + path, result);
    std::ofstream out(file, std::ios::binary);
    if (!(out << bytes) || !out.flush())
        RegistryFailed("cannot write " + file, ERROR_CANTWRITE);
}

void Import(const std::string& file) {
    std::ifstream in(file, std::ios::binary);
    if (!in)
        ut::tool::Fail(kExitUsage, "registry: cannot read " + file);
    std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    platform::RegFileProblem problem;
    LONG result = platform::ImportRegFile(bytes.data(), bytes.size(), &problem);
    if (result != ERROR_SUCCESS)
        RegistryFailed(file + ":" + std::to_string(problem.line) + ": " + Narrow(problem.message) +
                           "; nothing was imported",
                       result);
}

} // namespace

void AddRegistryCommand(CLI::App& app) {
    CLI::App* registry = app.add_subcommand(
        "registry", "List the library's registrations, read keys, export and import .reg files.");
    registry->require_subcommand(1);
    AddRegistryListCommand(*registry);

    // The options live as long as the parser that fills them.
    auto path = std::make_shared<std::string>();
    auto name = std::make_shared<std::string>();
    auto file = std::make_shared<std::string>();

    CLI::App* get =
        registry->add_subcommand("get", "show the values and sub-keys of a key, or one value's data");
    get->add_option("KEY", *path, "the key, e.g. HKEY_CURRENT_USER\\Software\\ut-tests")->required();
    CLI::Option* valueName = get->add_option("NAME", *name, "one value to show (\"\" for the default value)");
    get->callback([path, name, valueName] { Get(*path, *name, valueName->count() > 0); });

    CLI::App* exported =
        registry->add_subcommand("export", "write a key with everything below it as a .reg file");
    exported->add_option("KEY", *path, "the key to export")->required();
    exported->add_option("FILE", *file, "the .reg file to write")->required();
    exported->callback([path, file] { Export(*path, *file); });

    CLI::App* imported = registry->add_subcommand("import", "apply a .reg file, all of it or nothing");
    imported->add_option("FILE", *file, "the .reg file to read")->required()->check(CLI::ExistingFile);
    imported->callback([file] { Import(*file); });
}

} // namespace ut::tool
