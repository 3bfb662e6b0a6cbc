// Small helpers of the registry tests: value data in memory's layout, and keys, names and values
// read back in one call each.
#pragma once

#include <cstdint>
#include <cstring>
#include <initializer_list>
#include <string>
#include <vector>

#include <ut/platform/registry.h>
#include <ut/platform/text.h>

namespace ut::test {

using Bytes = std::vector<BYTE>;

// Text as a text value holds it: wchar_t units with the terminator.
inline Bytes TextBytes(const std::wstring& text) {
    Bytes bytes((text.size() + 1) * sizeof(wchar_t));
    std::memcpy(bytes.data(), text.c_str(), bytes.size());
    return bytes;
}

// A REG_MULTI_SZ block: each string with its terminator, then one more.
inline Bytes MultiBytes(std::initializer_list<std::wstring> texts) {
    std::wstring block;
    for (const std::wstring& text : texts)
        block.append(text).push_back(L'\0');
    return TextBytes(block);
}

inline Bytes LittleEndian(std::uint64_t value, std::size_t size) {
    Bytes bytes(size);
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<BYTE>(value >> (8 * i));
    return bytes;
}

inline std::string Narrow(const std::wstring& text) {
    return platform::Utf8FromWide(text);
}

// Creates (or opens) `path` below `parent`; null on failure.
inline UniqueHKey CreateKey(HKEY parent, const std::wstring& path, REGSAM access = KEY_ALL_ACCESS,
                            DWORD* disposition = nullptr) {
    HKEY key = nullptr;
    if (RegCreateKeyExW(parent, path.c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE, access, nullptr, &key,
                        disposition) != ERROR_SUCCESS)
        return nullptr;
    return UniqueHKey(key);
}

inline UniqueHKey OpenKey(HKEY parent, const std::wstring& path, REGSAM access = KEY_READ) {
    HKEY key = nullptr;
    if (RegOpenKeyExW(parent, path.c_str(), 0, access, &key) != ERROR_SUCCESS)
        return nullptr;
    return UniqueHKey(key);
}

// Sets a value to exactly `data`: a unit that is not zero follows it in memory, so that the
// registry does not complete text that lacks its terminator (it reads one unit past the count).
inline LONG SetValue(HKEY key, const wchar_t* name, DWORD type, const Bytes& data) {
    Bytes padded(data);
    padded.insert(padded.end(), sizeof(wchar_t), 1);
    return RegSetValueExW(key, name, 0, type, padded.data(), static_cast<DWORD>(data.size()));
}

inline LONG SetText(HKEY key, const wchar_t* name, const std::wstring& text) {
    return SetValue(key, name, REG_SZ, TextBytes(text));
}

struct Value {
    LONG result = ERROR_SUCCESS;
    DWORD type = REG_NONE;
    Bytes data;
};

inline Value QueryValue(HKEY key, const wchar_t* name) {
    Value value;
    DWORD size = 0;
    value.result = RegQueryValueExW(key, name, nullptr, &value.type, nullptr, &size);
    if (value.result != ERROR_SUCCESS)
        return value;
    value.data.resize(size);
    value.result = RegQueryValueExW(key, name, nullptr, &value.type, value.data.data(), &size);
    value.data.resize(size);
    return value;
}

// The sub-key names in enumeration order.
inline std::vector<std::wstring> SubKeyNames(HKEY key) {
    std::vector<std::wstring> names;
    wchar_t name[512];
    for (DWORD index = 0;; ++index) {
        DWORD length = 512;
        if (RegEnumKeyExW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr) != ERROR_SUCCESS)
            return names;
        names.emplace_back(name, length);
    }
}

inline std::vector<std::wstring> ValueNames(HKEY key) {
    std::vector<std::wstring> names;
    wchar_t name[512];
    for (DWORD index = 0;; ++index) {
        DWORD length = 512;
        if (RegEnumValueW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr) != ERROR_SUCCESS)
            return names;
        names.emplace_back(name, length);
    }
}

} // namespace ut::test
