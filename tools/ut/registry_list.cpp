// ut registry list: the classes registered in the categories of the library's registry key, each
// with the name or path it was registered with.
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <ut/detail/names.h>
#include <ut/platform/text.h>
#include <ut/registration.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/resources.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct ListArguments {
    std::string category;
    bool json = false;
};

struct Registered {
    std::wstring clsid;
    std::wstring text;
    bool isPath = false; // a "Path" record rather than a "Name"
};

struct Category {
    std::wstring name;
    std::vector<Registered> classes;
};

// The library's registry key below HKEY_LOCAL_MACHINE, without its closing backslash.
std::wstring BaseKey() {
    wchar_t key[kPathCapacity] = L"";
    HINSTANCE library = KXDictFindInstance(kDictionaryName);
    if (!library || GWResourceConstructRegKey(library, L"", key, kPathCapacity) != ERROR_SUCCESS)
        Fail(kExitUsage, "the library did not load: it has no registry key");
    std::wstring base(key);
    base.pop_back();
    return base;
}

std::vector<std::wstring> CategoryNames() {
    std::vector<std::wstring> names;
    if (UniqueHKey base = sdk::OpenKey(HKEY_LOCAL_MACHINE, BaseKey().c_str()))
        (void)sdk::ForEachSubKey(base.get(), [&](const wchar_t* name) { // a walk cut short lists less
            names.emplace_back(name);
            return true;
        });
    return names;
}

// The classes of a category; false when it is not a category of classes.
bool ReadCategory(const std::wstring& name, Category& category) {
    DWORD count = 0;
    GUID* list = nullptr;
    if (FAILED(KXGetCLSIDList(name.c_str(), &count, &list)))
        return false;
    std::unique_ptr<GUID, TaskMemDeleter> owned(list);
    category.name = name;
    for (DWORD i = 0; i < count; ++i) {
        Registered entry{GuidToString(list[i]), L"", false};
        wchar_t text[kPathCapacity] = L"";
        DWORD bytes = sizeof text;
        (void)KXGetKeyName(name.c_str(), list[i], text, &bytes); // a class without a name shows its path
        entry.text = text;
        if (entry.text.empty()) {
            std::wstring classKey = BaseKey() + L"\\" + name + L"\\" + entry.clsid;
            if (UniqueHKey key = sdk::OpenKey(HKEY_LOCAL_MACHINE, classKey.c_str()))
                entry.isPath = sdk::ReadText(key.get(), L"Path", entry.text) == ERROR_SUCCESS;
        }
        category.classes.push_back(std::move(entry));
    }
    return true;
}

void PrintText(const std::vector<Category>& categories) {
    for (const Category& category : categories) {
        std::printf("%s\n", platform::Utf8FromWide(category.name).c_str());
        for (const Registered& entry : category.classes)
            std::printf("  %s  %s\n", platform::Utf8FromWide(entry.clsid).c_str(),
                        platform::Utf8FromWide(entry.text).c_str());
    }
}

void PrintJson(const std::vector<Category>& categories) {
    nlohmann::ordered_json out = nlohmann::ordered_json::object();
    for (const Category& category : categories) {
        nlohmann::ordered_json classes = nlohmann::ordered_json::array();
        for (const Registered& entry : category.classes)
            classes.push_back({{"clsid", platform::Utf8FromWide(entry.clsid)},
                               {entry.isPath ? "path" : "name", platform::Utf8FromWide(entry.text)}});
        out[platform::Utf8FromWide(category.name)] = std::move(classes);
    }
    std::printf("%s\n", out.dump(2).c_str());
}

void List(const ListArguments& arguments) {
    std::vector<Category> categories;
    if (!arguments.category.empty()) {
        Category category;
        if (!ReadCategory(platform::WideFromUtf8(arguments.category), category))
            Fail(kExitNo, "no category of classes named '" + arguments.category + "'");
        categories.push_back(std::move(category));
    } else {
        for (const std::wstring& name : CategoryNames()) {
            Category category;
            if (ReadCategory(name, category)) // the editors' keys are no categories of classes
                categories.push_back(std::move(category));
        }
    }
    if (arguments.json)
        PrintJson(categories);
    else
        PrintText(categories);
}

} // namespace

void AddRegistryListCommand(CLI::App& registry) {
    auto arguments = std::make_shared<ListArguments>();
    CLI::App* list = registry.add_subcommand(
        "list", "List the classes registered in CATEGORY (Operator, View, Translator, ...) with their names "
                "or paths; without CATEGORY, every category of the library's registry key.");
    list->add_option("CATEGORY", arguments->category, "a category of classes, e.g. Operator");
    list->add_flag("--json", arguments->json, "print one JSON object: category -> [{clsid, name or path}]");
    list->footer("Examples:\n  ut registry list                 every category and its classes\n"
                 "  ut registry list Operator --json the operators as JSON\n"
                 "Exit status: 1 when CATEGORY is not a category of classes.");
    list->callback([arguments] { List(*arguments); });
}

} // namespace ut::tool
