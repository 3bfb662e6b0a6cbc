// The registration family's shared steps, and its two primitives: writing one value into a class
// key of a category, and deleting a class key.
#include "registration/keys.h"

#include <ut/registration.h>

namespace ut::registration {
namespace {

// The name list of a key walk holds this many characters.
constexpr DWORD kListedNameCapacity = 160;

std::wstring_view Text(const wchar_t* text) {
    return text ? std::wstring_view(text) : std::wstring_view();
}

} // namespace

std::wstring CategoryKey(const wchar_t* name) {
    return std::wstring(module::Current().baseKey.View()).append(Text(name));
}

std::wstring CategoryKey(const wchar_t* name, const wchar_t* item) {
    return CategoryKey(name).append(L"\\").append(Text(item));
}

std::wstring CategoryKey(const wchar_t* name, const wchar_t* item, const wchar_t* leaf) {
    return CategoryKey(name, item).append(L"\\").append(Text(leaf));
}

UniqueHKey Open(HKEY parent, const std::wstring& path, REGSAM access) {
    return sdk::OpenKey(parent, path.c_str(), access);
}

UniqueHKey Create(HKEY parent, const std::wstring& path) {
    UniqueHKey key;
    (void)sdk::CreateKey(parent, path.c_str(), key); // a null key says it
    return key;
}

LONG ReadCheckedText(HKEY key, const wchar_t* name, wchar_t* buffer, DWORD* byteCount) {
    const DWORD room = *byteCount;
    DWORD type = REG_NONE;
    LONG read = RegQueryValueExW(key, name, nullptr, &type, reinterpret_cast<BYTE*>(buffer), byteCount);
    if (read != ERROR_SUCCESS || !buffer)
        return read;
    auto empty = [&] {
        if (room >= sizeof(wchar_t))
            buffer[0] = L'\0';
    };
    const DWORD bytes = *byteCount;
    if (bytes == 0) {
        empty();
        return ERROR_SUCCESS;
    }
    const std::size_t units = bytes / sizeof(wchar_t);
    const bool whole = bytes % sizeof(wchar_t) == 0;
    const bool text =
        (type == REG_SZ || type == REG_EXPAND_SZ) && whole && units >= 1 && buffer[units - 1] == 0;
    const bool multi =
        type == REG_MULTI_SZ && whole && units >= 2 && buffer[units - 1] == 0 && buffer[units - 2] == 0;
    if (text || multi)
        return ERROR_SUCCESS;
    empty();
    return ERROR_INVALID_DATA;
}

HRESULT ListSubKeyIds(UniqueHKey key, DWORD* count, GUID** list) {
    *count = 0;
    *list = nullptr;
    DWORD subKeys = 0;
    if (RegQueryInfoKeyW(key.get(), nullptr, nullptr, nullptr, &subKeys, nullptr, nullptr, nullptr, nullptr,
                         nullptr, nullptr, nullptr) != ERROR_SUCCESS)
        return E_FAIL;
    *count = subKeys;
    *list = static_cast<GUID*>(CoTaskMemAlloc(subKeys * sizeof(GUID)));
    if (!*list)
        return E_OUTOFMEMORY;
    HRESULT hr = S_OK;
    wchar_t name[kListedNameCapacity];
    for (DWORD i = 0; i < subKeys && SUCCEEDED(hr); ++i) {
        DWORD length = kListedNameCapacity;
        if (RegEnumKeyExW(key.get(), i, name, &length, nullptr, nullptr, nullptr, nullptr) != ERROR_SUCCESS)
            hr = E_FAIL;
        else
            hr = CLSIDFromString(name, &(*list)[i]);
    }
    if (RegCloseKey(key.release()) != ERROR_SUCCESS && SUCCEEDED(hr))
        hr = E_FAIL;
    if (FAILED(hr)) {
        CoTaskMemFree(*list);
        *list = nullptr;
        *count = 0;
    }
    return hr;
}

} // namespace ut::registration

using namespace ut::registration;
using ut::UniqueHKey;

HRESULT KXAddRegistryKey(const GUID& clsid, const wchar_t* keyName, const wchar_t* valueName,
                         const wchar_t* value) {
    return Guarded(S_FALSE, [&]() -> HRESULT {
        ut::UniqueHKey category = Create(HKEY_LOCAL_MACHINE, CategoryKey(keyName));
        if (!category)
            return S_FALSE;
        ut::UniqueHKey classKey = Create(category.get(), ut::GuidToString(clsid));
        if (!classKey)
            return S_FALSE;
        if (!value)
            return E_FAIL; // a programming error of the caller's
        return ut::sdk::SetText(classKey.get(), valueName, value) == ERROR_SUCCESS ? S_OK : S_FALSE;
    });
}

HRESULT KXRemRegistryKey(const GUID& clsid, const wchar_t* keyName) {
    return Guarded(S_FALSE, [&]() -> HRESULT {
        // Created, not opened: a missing category is made rather than taken as absent.
        ut::UniqueHKey category = Create(HKEY_LOCAL_MACHINE, CategoryKey(keyName));
        if (!category)
            return S_FALSE;
        return RegDeleteKeyW(category.get(), ut::GuidToString(clsid).c_str()) == ERROR_SUCCESS ? S_OK
                                                                                               : S_FALSE;
    });
}
