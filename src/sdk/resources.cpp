// Module registry keys and the string-dictionary registry.
#include <map>
#include <mutex>
#include <string>

#include <ut/platform/process.h>
#include <ut/platform/detail/boundary.h>
#include <ut/sdk/resources.h>

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
