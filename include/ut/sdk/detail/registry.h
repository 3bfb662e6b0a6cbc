// Registry machinery that the SDK, the reference host and the library share, not for plug-ins:
// where the host keeps its branches, the calls every registration makes, and write batches.
#pragma once

#include <string>

#include <ut/platform/registry.h>
#include <ut/sdk/export.h>

namespace ut::sdk {

// Branches under HKEY_LOCAL_MACHINE: the modules' keys (GWResourceConstructRegKey), the host's
// core branch (GWConstructKxcoreRegKey) and the reference host's object families. The user's
// preferences live under HKEY_CURRENT_USER.
inline constexpr const wchar_t* kModulesBranch = L"Software\\ut\\Modules";
inline constexpr const wchar_t* kCoreBranch = L"Software\\ut\\Core";
inline constexpr const wchar_t* kFamiliesBranch = L"Software\\ut\\Families";
inline constexpr const wchar_t* kPreferencesBranch = L"Software\\ut\\Preferences";

// Keys opened or created for writing ask for both rights.
inline constexpr REGSAM kReadWrite = KEY_READ | KEY_WRITE;

// Registry byte counts of text: wchar_t units times their size.
constexpr DWORD TextBytes(std::size_t characters) {
    return static_cast<DWORD>(characters * sizeof(wchar_t));
}

// Opens `path` below `parent`; null when it cannot be opened.
inline UniqueHKey OpenKey(HKEY parent, const wchar_t* path, REGSAM access = KEY_READ) {
    HKEY key = nullptr;
    if (RegOpenKeyExW(parent, path, 0, access, &key) != ERROR_SUCCESS)
        return nullptr;
    return UniqueHKey(key);
}

// Creates or opens `path` below `parent`, non-volatile, with no class and default security.
inline LONG CreateKey(HKEY parent, const wchar_t* path, UniqueHKey& key, REGSAM access = kReadWrite) {
    HKEY made = nullptr;
    LONG result =
        RegCreateKeyExW(parent, path, 0, nullptr, REG_OPTION_NON_VOLATILE, access, nullptr, &made, nullptr);
    key.reset(result == ERROR_SUCCESS ? made : nullptr);
    return result;
}

// Writes `text` with its terminator as a REG_SZ value.
inline LONG SetText(HKEY key, const wchar_t* name, const wchar_t* text) {
    std::size_t length = std::char_traits<wchar_t>::length(text);
    return RegSetValueExW(key, name, 0, REG_SZ, reinterpret_cast<const BYTE*>(text), TextBytes(length + 1));
}

// Reads the text value `name` (REG_SZ or REG_EXPAND_SZ) without its terminator;
// ERROR_INVALID_DATA for a value of another type.
inline LONG ReadText(HKEY key, const wchar_t* name, std::wstring& text) {
    text.clear();
    DWORD type = REG_NONE, size = 0;
    LONG result = RegQueryValueExW(key, name, nullptr, &type, nullptr, &size);
    if (result != ERROR_SUCCESS)
        return result;
    if (type != REG_SZ && type != REG_EXPAND_SZ)
        return ERROR_INVALID_DATA;
    // Room for a terminator the value may lack.
    std::wstring read(size / sizeof(wchar_t) + 1, L'\0');
    size = TextBytes(read.size());
    result = RegQueryValueExW(key, name, nullptr, &type, reinterpret_cast<BYTE*>(read.data()), &size);
    if (result != ERROR_SUCCESS)
        return result;
    read.resize(std::char_traits<wchar_t>::length(read.c_str()));
    text = std::move(read);
    return ERROR_SUCCESS;
}

// Calls `visit` with the name of each sub-key of `key` in the registry's order, until it answers
// false or the sub-keys run out.
template <class Visit>
LONG ForEachSubKey(HKEY key, Visit&& visit) {
    constexpr DWORD kLongestName = 256; // key names hold at most 255 characters
    wchar_t name[kLongestName];
    for (DWORD index = 0;; ++index) {
        DWORD length = kLongestName;
        LONG result = RegEnumKeyExW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr);
        if (result == ERROR_NO_MORE_ITEMS)
            return ERROR_SUCCESS;
        if (result != ERROR_SUCCESS)
            return result;
        if (!visit(static_cast<const wchar_t*>(name)))
            return ERROR_SUCCESS;
    }
}

// Drops the key `path` of `root` when it holds neither values nor sub-keys: S_OK when it went,
// S_FALSE when it holds something or is not there, else the registry's failure.
UT_SDK_API HRESULT DropEmptyKey(HKEY root, const wchar_t* path);

// Runs the registry calls of one operation in one store transaction, when no transaction is open
// yet: its writes reach the disk together, once, and its reads see one state of the store (and
// pay the store's locking once rather than per call). What was written is kept whatever the
// operation answers: the batch commits at the end either way, and only a failed commit loses it.
// Inside a transaction that is already open (a caller's batch, or a host's around a plug-in's
// registration), and on a store that cannot be written, it does nothing. On Windows each registry
// call stands alone.
class RegistryBatch {
public:
    RegistryBatch() : open_(platform::BeginRegistryTransaction() == ERROR_SUCCESS) {}
    ~RegistryBatch() { (void)Commit(); } // an operation that ignores the commit has no use for its result
    RegistryBatch(const RegistryBatch&) = delete;
    RegistryBatch& operator=(const RegistryBatch&) = delete;

    // ERROR_SUCCESS when what was written is in the store (or there was no batch to commit).
    LONG Commit() {
        if (!open_)
            return ERROR_SUCCESS;
        open_ = false;
        return platform::CommitRegistryTransaction();
    }

private:
    bool open_;
};

// Runs `body` in a registry batch; when the body succeeded but its writes could not be committed,
// answers `lost` instead.
template <class Body>
HRESULT Batched(Body&& body, HRESULT lost) {
    RegistryBatch batch;
    HRESULT hr = body();
    LONG committed = batch.Commit();
    return committed != ERROR_SUCCESS && SUCCEEDED(hr) ? lost : hr;
}

} // namespace ut::sdk
