// Module registry keys, the string-dictionary registry and the modules' string tables.
#include <deque>
#include <map>
#include <mutex>
#include <string>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/process.h>
#include <ut/sdk/resources.h>

#include "text_tables.h"

namespace {

// "dir/libut.so" and "C:\dir\ut.dll" both give "ut".
std::wstring ModuleStem(const std::wstring& path) {
    std::size_t slash = path.find_last_of(L"/\\");
    std::wstring name = slash == std::wstring::npos ? path : path.substr(slash + 1);
    std::size_t dot = name.find(L'.');
    if (dot != std::wstring::npos)
        name.resize(dot);
    if (name.size() > 3 && name.compare(0, 3, L"lib") == 0)
        name.erase(0, 3);
    return name;
}

struct Dictionaries {
    std::mutex mutex;
    std::map<std::wstring, HINSTANCE> byName;
};

// Never destroyed: modules unregister their dictionaries while the process exits.
Dictionaries& AllDictionaries() {
    static Dictionaries* dictionaries = new Dictionaries;
    return *dictionaries;
}

// The name `module` registered its dictionary under, or empty.
std::wstring DictionaryOf(HINSTANCE module) {
    Dictionaries& all = AllDictionaries();
    std::lock_guard lock(all.mutex);
    for (const auto& [name, owner] : all.byName)
        if (owner == module)
            return name;
    return {};
}

const wchar_t* DictionaryText(const std::wstring& name, unsigned id, HINSTANCE owner) {
    const wchar_t* text = ut::sdk::FindText(ut::sdk::TextKind::Dictionary, name, id, owner, nullptr);
    return text ? text : L"";
}

// The texts that modules gave, by module and id. Texts are never freed, so that a pointer handed
// out stays valid when its entry is replaced.
struct StringTables {
    std::mutex mutex;
    std::deque<std::wstring> texts;
    std::map<std::pair<HINSTANCE, unsigned int>, const wchar_t*> byId;
};

// Never destroyed: texts handed out must outlive every module that reads them.
StringTables& AllStringTables() {
    static StringTables* tables = new StringTables;
    return *tables;
}

// The text the module gave in a string table, or null.
const wchar_t* TableText(HINSTANCE module, unsigned int id) {
    StringTables& tables = AllStringTables();
    std::lock_guard lock(tables.mutex);
    auto found = tables.byId.find(std::pair(module, id));
    return found == tables.byId.end() ? nullptr : found->second;
}

LONG ConstructRegKey(HINSTANCE module, const wchar_t* subKey, wchar_t* buffer, int capacity) {
    std::wstring stem = ModuleStem(ut::platform::ModuleFileName(module));
    if (stem.empty())
        return ERROR_INVALID_PARAMETER;
    std::wstring key = L"Software\\ut\\Modules\\" + stem + L"\\";
    if (subKey && *subKey) {
        key += subKey;
        if (key.back() != L'\\')
            key += L'\\';
    }
    if (key.size() + 1 > static_cast<std::size_t>(capacity))
        return ERROR_INSUFFICIENT_BUFFER;
    key.copy(buffer, key.size());
    buffer[key.size()] = L'\0';
    return ERROR_SUCCESS;
}

} // namespace

LONG GWResourceConstructRegKey(HINSTANCE module, const wchar_t* subKey, wchar_t* buffer, int capacity) {
    if (!buffer || capacity <= 0)
        return ERROR_INVALID_PARAMETER;
    buffer[0] = L'\0';
    return ut::ExportBoundary([&] { return ConstructRegKey(module, subKey, buffer, capacity); },
                              LONG{ERROR_OUTOFMEMORY});
}

HRESULT KXDictRegisterInstance(HINSTANCE module, const wchar_t* name) {
    if (!module || !name || !*name)
        return E_INVALIDARG;
    return ut::ExportBoundary([&] {
        Dictionaries& all = AllDictionaries();
        std::lock_guard lock(all.mutex);
        all.byName[name] = module;
        return S_OK;
    });
}

HRESULT KXDictUnregisterInstance(const wchar_t* name) {
    if (!name)
        return E_INVALIDARG;
    return ut::ExportBoundary([&] {
        Dictionaries& all = AllDictionaries();
        std::lock_guard lock(all.mutex);
        return all.byName.erase(name) ? S_OK : S_FALSE;
    });
}

HINSTANCE KXDictFindInstance(const wchar_t* name) {
    if (!name)
        return nullptr;
    return ut::ExportBoundary(
        [&] {
            Dictionaries& all = AllDictionaries();
            std::lock_guard lock(all.mutex);
            auto it = all.byName.find(name);
            return it == all.byName.end() ? HINSTANCE{} : it->second;
        },
        HINSTANCE{});
}

const wchar_t* DictLoadIdstring(const wchar_t* dictionary, unsigned short id) {
    if (!dictionary || !*dictionary)
        return L"";
    return ut::ExportBoundary([&] { return DictionaryText(dictionary, id, KXDictFindInstance(dictionary)); },
                              L"");
}

const wchar_t* KXDictLoadInstanceIdstring(HINSTANCE module, unsigned int id) {
    if (!module)
        return L"";
    if (const wchar_t* text = TableText(module, id))
        return text;
    return ut::ExportBoundary(
        [&] {
            std::wstring name = DictionaryOf(module);
            return name.empty() ? L"" : DictionaryText(name, id, module);
        },
        L"");
}

HRESULT KXDictLoadFile(const wchar_t* name, const wchar_t* path) {
    if (!name)
        return E_INVALIDARG;
    return ut::ExportBoundary(
        [&] { return ut::sdk::LoadTextTable(ut::sdk::TextKind::Dictionary, name, path); });
}

HRESULT KXDictAddInstanceStrings(HINSTANCE module, const KXDictString* strings, unsigned int count) {
    if (!module)
        return E_INVALIDARG;
    if (count != 0 && !strings)
        return E_POINTER;
    for (unsigned int i = 0; i < count; ++i)
        if (!strings[i].text)
            return E_POINTER;
    return ut::ExportBoundary([&] {
        StringTables& tables = AllStringTables();
        std::lock_guard lock(tables.mutex);
        for (unsigned int i = 0; i < count; ++i) {
            const wchar_t* text = tables.texts.emplace_back(strings[i].text).c_str();
            tables.byId.insert_or_assign(std::pair(module, strings[i].id), text);
        }
        return S_OK;
    });
}
