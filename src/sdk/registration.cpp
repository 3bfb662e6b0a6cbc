// The host's registration services: in-process classes in the class registry, the core branch,
// and the tidying of emptied keys.
#include <ut/sdk/registration.h>

#include <cwctype>
#include <string>
#include <string_view>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/process.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/testing.h>

namespace {

using ut::sdk::CreateKey;
using ut::sdk::SetText;

HRESULT FromRegistry(LONG error) {
    return error == ERROR_SUCCESS ? S_OK : HRESULT_FROM_WIN32(static_cast<DWORD>(error));
}

std::wstring ClassKey(REFCLSID clsid) {
    return L"CLSID\\" + ut::GuidToString(clsid);
}

LONG WriteClass(REFCLSID clsid, const std::wstring& server, const wchar_t* name) {
    ut::UniqueHKey key, inproc;
    LONG result = CreateKey(HKEY_CLASSES_ROOT, ClassKey(clsid).c_str(), key);
    if (result == ERROR_SUCCESS)
        result = SetText(key.get(), nullptr, name);
    if (result == ERROR_SUCCESS)
        result = CreateKey(key.get(), L"InprocServer32", inproc);
    if (result == ERROR_SUCCESS)
        result = SetText(inproc.get(), nullptr, server.c_str());
    if (result == ERROR_SUCCESS)
        result = SetText(inproc.get(), L"ThreadingModel", L"Apartment");
    return result;
}

bool StartsWithCaseless(std::wstring_view text, std::wstring_view prefix) {
    if (text.size() < prefix.size())
        return false;
    for (std::size_t i = 0; i < prefix.size(); ++i)
        if (std::towupper(static_cast<wint_t>(text[i])) != std::towupper(static_cast<wint_t>(prefix[i])))
            return false;
    return true;
}

// How much of `path` always stays: a module's key and what is above it, or, outside the modules'
// branch, everything above the key itself.
std::size_t KeptLength(const std::wstring& path) {
    std::wstring modules = std::wstring(ut::sdk::kModulesBranch) + L"\\";
    if (StartsWithCaseless(path, modules)) {
        std::size_t moduleEnd = path.find(L'\\', modules.size());
        return moduleEnd == std::wstring::npos ? path.size() : moduleEnd;
    }
    std::size_t parentEnd = path.rfind(L'\\');
    return parentEnd == std::wstring::npos ? 0 : parentEnd;
}

HRESULT CleanKey(HKEY root, std::wstring path) {
    while (!path.empty() && path.back() == L'\\')
        path.pop_back();
    std::size_t kept = KeptLength(path);
    if (path.size() <= kept)
        return S_FALSE;
    HRESULT first = ut::sdk::DropEmptyKey(root, path.c_str());
    for (HRESULT dropped = first; dropped == S_OK;) {
        std::size_t cut = path.rfind(L'\\');
        if (cut == std::wstring::npos || cut <= kept)
            break;
        path.resize(cut);
        dropped = ut::sdk::DropEmptyKey(root, path.c_str());
    }
    return first;
}

} // namespace

namespace ut::sdk {

HRESULT DropEmptyKey(HKEY root, const wchar_t* path) {
    UniqueHKey key = OpenKey(root, path);
    if (!key)
        return S_FALSE;
    // Asking for the first entry costs the same however many there are; counting them does not.
    wchar_t name[1];
    DWORD length = 1;
    LONG subKey = RegEnumKeyExW(key.get(), 0, name, &length, nullptr, nullptr, nullptr, nullptr);
    length = 1;
    LONG value = RegEnumValueW(key.get(), 0, name, &length, nullptr, nullptr, nullptr, nullptr);
    key.reset();
    for (LONG first : {subKey, value}) {
        if (first == ERROR_SUCCESS || first == ERROR_MORE_DATA)
            return S_FALSE;
        if (first != ERROR_NO_MORE_ITEMS)
            return FromRegistry(first);
    }
    LONG deleted = RegDeleteKeyW(root, path);
    return deleted == ERROR_FILE_NOT_FOUND ? S_FALSE : FromRegistry(deleted);
}

} // namespace ut::sdk

HRESULT GWConstructKxcoreRegKey(const wchar_t* subKey, wchar_t* buffer, int capacity) {
    if (!buffer)
        return E_POINTER;
    if (capacity < 1)
        return E_INVALIDARG;
    buffer[0] = L'\0';
    if (HRESULT hr = ut::sdk::CheckHostFault("GWConstructKxcoreRegKey"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::wstring key = ut::sdk::kCoreBranch;
        if (subKey && *subKey)
            key.append(L"\\").append(subKey);
        if (key.size() >= static_cast<std::size_t>(capacity))
            return HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER);
        key.copy(buffer, key.size());
        buffer[key.size()] = L'\0';
        return S_OK;
    });
}

HRESULT GWRegisterCOMObject(REFCLSID clsid, HINSTANCE module, const wchar_t* name) {
    if (!name)
        return E_POINTER;
    if (IsEqualGUID(clsid, GUID_NULL))
        return E_INVALIDARG;
    if (HRESULT hr = ut::sdk::CheckHostFault("GWRegisterCOMObject"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::wstring server = ut::platform::ModuleFileName(module);
        if (server.empty())
            return E_INVALIDARG;
        return ut::sdk::Batched([&] { return FromRegistry(WriteClass(clsid, server, name)); }, E_FAIL);
    });
}

HRESULT GWUnregisterCOMObject(REFCLSID clsid) {
    if (HRESULT hr = ut::sdk::CheckHostFault("GWUnregisterCOMObject"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        LONG deleted = RegDeleteTreeW(HKEY_CLASSES_ROOT, ClassKey(clsid).c_str());
        return deleted == ERROR_FILE_NOT_FOUND ? S_FALSE : FromRegistry(deleted);
    });
}

HRESULT GwRegCleanKey(HKEY root, const wchar_t* subKey) {
    if (!subKey)
        return E_INVALIDARG;
    if (HRESULT hr = ut::sdk::CheckHostFault("GwRegCleanKey"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] { return CleanKey(root, subKey); });
}

HRESULT GWRegDeleteKey(HKEY parent, const wchar_t* subKey) {
    if (!subKey || !*subKey)
        return E_INVALIDARG;
    if (HRESULT hr = ut::sdk::CheckHostFault("GWRegDeleteKey"); FAILED(hr))
        return hr;
    return FromRegistry(RegDeleteTreeW(parent, subKey));
}
