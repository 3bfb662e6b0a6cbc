// Reading registrations back: class names, class lists, manipulator controls, inspectors, and the
// paths kept in the registry.
#include <cstring>

#include <ut/registration.h>
#include <ut/sdk/paths.h>
#include <ut/sdk/registration.h>
#include <ut/sdk/views.h>

#include "registration/keys.h"

namespace ut::registration {
namespace {

// Capacities in characters: sub-key names in the walk of KXGetKeyName, and the fixed buffers of
// the inspector, the view name and the "QVX" path lookups.
constexpr DWORD kWalkNameCapacity = 512;
constexpr DWORD kInspectorTextCapacity = 80;
constexpr DWORD kShortTextCapacity = 40;

HRESULT Answer(LONG error) {
    return error == ERROR_SUCCESS ? S_OK : E_FAIL;
}

// The class key of `clsid` below `category`. The key named by the identifier's text is tried
// first, which finds every spelling the registry takes for the same name; only when it is not
// there are the sub-keys walked for a name that parses to the identifier some other way.
UniqueHKey FindClassKey(HKEY category, const GUID& clsid) {
    if (UniqueHKey direct = Open(category, GuidToString(clsid)))
        return direct;
    wchar_t name[kWalkNameCapacity];
    for (DWORD index = 0;; ++index) {
        DWORD length = kWalkNameCapacity;
        if (RegEnumKeyExW(category, index, name, &length, nullptr, nullptr, nullptr, nullptr) !=
            ERROR_SUCCESS)
            return nullptr;
        GUID parsed{};
        if (FAILED(ParseGuid(name, &parsed)) || !IsEqualGUID(parsed, clsid))
            continue;
        if (UniqueHKey found = Open(category, name))
            return found;
    }
}

HRESULT GetKeyName(const wchar_t* keyName, const GUID& clsid, wchar_t* name, DWORD* byteCount) {
    UniqueHKey category = Open(HKEY_LOCAL_MACHINE, CategoryKey(keyName));
    if (!category)
        return E_FAIL;
    UniqueHKey classKey = FindClassKey(category.get(), clsid);
    if (!classKey)
        return E_FAIL;
    // Deliberately unchecked: a class key is enough for S_OK.
    (void)RegQueryValueExW(classKey.get(), L"Name", nullptr, nullptr, reinterpret_cast<BYTE*>(name),
                           byteCount);
    return S_OK;
}

HRESULT GetCLSIDList(const wchar_t* keyName, DWORD* count, GUID** list) {
    *count = 0;
    *list = nullptr;
    UniqueHKey category = Open(HKEY_LOCAL_MACHINE, CategoryKey(keyName));
    if (!category)
        return E_FAIL;
    return ListSubKeyIds(std::move(category), count, list);
}

// Opens the category for reading, then the class key below it by its identifier text.
UniqueHKey OpenClassKey(const wchar_t* category, const GUID& clsid) {
    UniqueHKey categoryKey = Open(HKEY_LOCAL_MACHINE, CategoryKey(category));
    return categoryKey ? Open(categoryKey.get(), GuidToString(clsid)) : nullptr;
}

HRESULT GetManipulator3DControls(const GUID& manipulator, DWORD* count, GUID** list) {
    *count = 0;
    *list = nullptr;
    UniqueHKey classKey = OpenClassKey(L"Manipulator", manipulator);
    if (!classKey)
        return E_FAIL;
    return ListSubKeyIds(std::move(classKey), count, list);
}

HRESULT GetQDEFFilename(const GUID& clsid, wchar_t* fileName, DWORD* byteCount) {
    wchar_t keyText[kPathCapacity];
    if (HRESULT hr = GWConstructKxcoreRegKey(L"QDEF", keyText, kPathCapacity); FAILED(hr))
        return hr;
    UniqueHKey qdef = Open(HKEY_LOCAL_MACHINE, keyText);
    if (!qdef)
        return E_FAIL;
    UniqueHKey classKey = Open(qdef.get(), GuidToString(clsid));
    if (!classKey)
        return E_FAIL;
    return Answer(RegQueryValueExW(classKey.get(), L"", nullptr, nullptr, reinterpret_cast<BYTE*>(fileName),
                                   byteCount));
}

HRESULT GetCorvaneViewName(const GUID& clsid, wchar_t* name) {
    UniqueHKey classKey = OpenClassKey(L"View", clsid);
    if (!classKey)
        return E_FAIL;
    DWORD bytes = TextBytes(kShortTextCapacity);
    if (ReadCheckedText(classKey.get(), L"Name", name, &bytes) == ERROR_SUCCESS)
        return S_OK;
    // Something to show for a caller that ignores the result.
    std::wstring text = GuidToString(clsid);
    std::memcpy(name, text.c_str(), (text.size() + 1) * sizeof(wchar_t));
    return E_FAIL;
}

// Opens `path` with the short form of the call, which hands back `parent` itself for an empty
// path: such a handle is not owned twice.
struct ShortOpen {
    ShortOpen(HKEY parent, const wchar_t* path) {
        HKEY key = nullptr;
        if (RegOpenKeyW(parent, path, &key) != ERROR_SUCCESS)
            return;
        handle = key;
        if (key != parent)
            owned.reset(key);
    }
    HKEY handle = nullptr;
    UniqueHKey owned;
};

HRESULT FindPathInRegistry(const GUID& clsid, const wchar_t* keyName, wchar_t* path) {
    ShortOpen qvx(HKEY_CLASSES_ROOT, L"QVX");
    if (!qvx.handle)
        return E_FAIL;
    ShortOpen category(qvx.handle, keyName);
    if (!category.handle)
        return E_FAIL;
    UniqueHKey classKey = Open(category.handle, GuidToString(clsid));
    if (!classKey)
        return E_FAIL;
    DWORD bytes = TextBytes(kShortTextCapacity); // the caller's buffer holds this much, no more
    return Answer(
        RegQueryValueExW(classKey.get(), L"Path", nullptr, nullptr, reinterpret_cast<BYTE*>(path), &bytes));
}

} // namespace
} // namespace ut::registration

using namespace ut::registration;
using ut::UniqueHKey;

HRESULT KXGetKeyName(const wchar_t* keyName, const GUID& clsid, wchar_t* name, DWORD* byteCount) {
    return Guarded(E_FAIL, [&] { return GetKeyName(keyName, clsid, name, byteCount); });
}
HRESULT KXGetPrimitiveName(const GUID& clsid, wchar_t* name, DWORD* byteCount) {
    return KXGetKeyName(L"Primitive", clsid, name, byteCount);
}
HRESULT KXGetOperatorName(const GUID& clsid, wchar_t* name, DWORD* byteCount) {
    return KXGetKeyName(L"Operator", clsid, name, byteCount);
}
HRESULT KXGetPropertyName(const GUID& clsid, wchar_t* name, DWORD* byteCount) {
    return KXGetKeyName(L"Property", clsid, name, byteCount);
}
HRESULT KXGetViewName(const GUID& clsid, wchar_t* name, DWORD* byteCount) {
    return KXGetKeyName(L"View", clsid, name, byteCount);
}

HRESULT KXGetObjectInspectorView(const GUID& view, GUID* inspector) {
    if (!inspector)
        return E_INVALIDARG;
    wchar_t text[kInspectorTextCapacity] = L"";
    DWORD bytes = TextBytes(kInspectorTextCapacity);
    if (FAILED(KXGetKeyName(L"Inspector View", view, text, &bytes))) {
        *inspector = GUID_NULL;
        return S_FALSE;
    }
    text[kInspectorTextCapacity - 1] = L'\0'; // a read that did not fit leaves no terminator behind
    return ut::ParseGuid(text, inspector);
}

HRESULT KXGetCLSIDList(const wchar_t* keyName, DWORD* count, GUID** list) {
    if (!count || !list)
        return E_POINTER;
    return Guarded(E_FAIL, [&] { return GetCLSIDList(keyName, count, list); });
}

HRESULT KXGetManipulators(DWORD* count, GUID** list) {
    return KXGetCLSIDList(L"Manipulator", count, list);
}

HRESULT KXGetManipulator3DControls(const GUID& manipulator, DWORD* count, GUID** list) {
    if (!count || !list)
        return E_POINTER;
    if (IsEqualGUID(manipulator, GUID_NULL))
        return E_INVALIDARG;
    return Guarded(E_FAIL, [&] { return GetManipulator3DControls(manipulator, count, list); });
}

HRESULT KXGetPathAtRegKey(const wchar_t* keyName, DWORD byteCount, wchar_t* path) {
    return Guarded(E_FAIL, [&] {
        UniqueHKey category = Open(HKEY_LOCAL_MACHINE, CategoryKey(keyName));
        if (!category)
            return E_FAIL;
        return Answer(ReadCheckedText(category.get(), L"Path", path, &byteCount));
    });
}

HRESULT KXSetPathAtRegKey(const wchar_t* keyName, const wchar_t* path) {
    return Guarded(E_FAIL, [&] {
        UniqueHKey category = Create(HKEY_LOCAL_MACHINE, CategoryKey(keyName));
        if (!category || !path)
            return E_FAIL;
        return Answer(ut::sdk::SetText(category.get(), L"Path", path));
    });
}

HRESULT KXGetPathInRegistry(const wchar_t* subKey, DWORD byteCount, wchar_t* path) {
    UniqueHKey key = ut::sdk::OpenKey(HKEY_CLASSES_ROOT, subKey);
    if (!key)
        return E_FAIL;
    return Answer(
        RegQueryValueExW(key.get(), L"Path", nullptr, nullptr, reinterpret_cast<BYTE*>(path), &byteCount));
}

HRESULT KXSetPathInRegistry(const wchar_t* subKey, const wchar_t* path) {
    HKEY created = nullptr;
    if (RegCreateKeyW(HKEY_CLASSES_ROOT, subKey, &created) != ERROR_SUCCESS)
        return E_FAIL;
    UniqueHKey key(created);
    if (!path)
        return E_FAIL;
    return Answer(ut::sdk::SetText(key.get(), L"Path", path));
}

HRESULT KXFindPathInRegistry(GUID clsid, const wchar_t* keyName, wchar_t* path) {
    return ut::ExportBoundary([&] { return FindPathInRegistry(clsid, keyName, path); });
}

HRESULT KXGetQDEFFilename(const GUID& clsid, wchar_t* fileName, DWORD* byteCount) {
    if (!fileName || !byteCount || *byteCount == 0)
        return E_POINTER;
    if (IsEqualGUID(clsid, GUID_NULL))
        return E_INVALIDARG;
    return ut::ExportBoundary([&] { return GetQDEFFilename(clsid, fileName, byteCount); });
}

HRESULT KXGetCorvaneViewName(GUID clsid, wchar_t* name) {
    if (!name)
        return E_POINTER;
    name[0] = L'\0';
    return Guarded(E_FAIL, [&] { return GetCorvaneViewName(clsid, name); });
}

HRESULT KXGetGWViewName(const GUID& clsid, CKXString& name) {
    return ut::ExportBoundary([&] {
        name = L"";
        wchar_t buffer[ut::kPathCapacity] = L"";
        if (HRESULT hr = GWFindViewNameFromCLSID(clsid, buffer, ut::kPathCapacity); hr != S_OK)
            return hr;
        name = buffer;
        return S_OK;
    });
}

DWORD KXGetFactoryRsrcPath(DWORD capacity, wchar_t* path) {
    return ut::ExportBoundary(
        [&] {
            CKXString folder;
            (void)KXGetFactoryPath(folder); // an unknown factory leaves the text relative
            CKXString text = folder + L"\\" + L"Application" + L"\\" + L"rsrc";
            const auto length = static_cast<DWORD>(text.Length());
            if (path && capacity > length)
                std::memcpy(path, text.c_str(), (static_cast<std::size_t>(length) + 1) * sizeof(wchar_t));
            else if (path && capacity != 0)
                path[0] = L'\0';
            return length;
        },
        DWORD{0});
}
