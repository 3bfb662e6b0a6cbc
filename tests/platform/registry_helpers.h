// Helpers of the registry tests: value data, keys, names and values in one call, every kind of value.
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

// Text as a text value holds it: wchar_t units, with the terminator unless told otherwise.
inline Bytes TextBytes(const std::wstring& text, bool terminated = true) {
    Bytes bytes((text.size() + terminated) * sizeof(wchar_t));
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

// Creates (or opens) or opens `path` below `parent`; null on failure.
inline UniqueHKey CreateKey(HKEY parent, const std::wstring& path, REGSAM access = KEY_ALL_ACCESS,
                            DWORD* disposition = nullptr) {
    HKEY key = nullptr;
    (void)RegCreateKeyExW(parent, path.c_str(), 0, nullptr, 0, access, nullptr, &key,
                          disposition); // null says it
    return UniqueHKey(key);
}
inline UniqueHKey OpenKey(HKEY parent, const std::wstring& path, REGSAM access = KEY_READ) {
    HKEY key = nullptr;
    (void)RegOpenKeyExW(parent, path.c_str(), 0, access, &key); // null says it
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
    value.data.resize(size);
    if (value.result == ERROR_SUCCESS)
        value.result = RegQueryValueExW(key, name, nullptr, &value.type, value.data.data(), &size);
    value.data.resize(value.result == ERROR_SUCCESS ? size : 0);
    return value;
}

// The names of the sub-keys, or of the values, in enumeration order.
inline std::vector<std::wstring> Names(HKEY key, bool values) {
    std::vector<std::wstring> names;
    wchar_t name[512];
    for (DWORD index = 0, length = 512;; ++index, length = 512) {
        LONG result = values ? RegEnumValueW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr)
                             : RegEnumKeyExW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr);
        if (result != ERROR_SUCCESS)
            return names;
        names.emplace_back(name, length);
    }
}
inline std::vector<std::wstring> SubKeyNames(HKEY key) {
    return Names(key, false);
}
inline std::vector<std::wstring> ValueNames(HKEY key) {
    return Names(key, true);
}

struct Sample {
    const wchar_t* name;
    DWORD type;
    Bytes data;
    bool anyEditor = true; // false where the system's registry editor does not carry it exactly
};

// One value of every kind, text without a terminator or with one inside included, under names
// that a ".reg" file must quote and escape.
inline const std::vector<Sample>& EveryKindOfValue() {
    static const std::vector<Sample> samples = {
        {L"", REG_SZ, TextBytes(L"the default")},
        {L"with space", REG_SZ, TextBytes(L"a \"quoted\" \\ back\\slash")},
        {L"quote \" and back\\slash", REG_SZ, TextBytes(L"")},
        {L"\u00c4pfel \u00e9t\u00e9", REG_SZ, TextBytes(L"\u00df \u4e2d \U0001F3AC")},
        {L"lines", REG_SZ, TextBytes(L"one\r\ntwo"), false},
        {L"unterminated", REG_SZ, TextBytes(L"ab", false), false},
        {L"inner zero", REG_SZ, MultiBytes({L"a", L"b"}), false},
        {L"expand", REG_EXPAND_SZ, TextBytes(L"%PATH%;\u00e9")},
        {L"multi", REG_MULTI_SZ, MultiBytes({L"one", L"two", L"\u00c4"})},
        {L"dword", REG_DWORD, LittleEndian(0xDEADBEEF, 4)},
        {L"short dword", REG_DWORD, LittleEndian(0x0102, 2), false},
        {L"qword", REG_QWORD, LittleEndian(0x0102030405060708, 8)},
        {L"binary", REG_BINARY,
         [] {
             Bytes bytes(300);
             for (std::size_t i = 0; i < bytes.size(); ++i)
                 bytes[i] = static_cast<BYTE>(i * 7);
             return bytes;
         }()},
        {L"empty binary", REG_BINARY, Bytes{}},
        {L"none", REG_NONE, Bytes{}},
        {L"none with bytes", REG_NONE, Bytes{1, 2}},
        {L"big endian", 5, LittleEndian(0x04030201, 4)},
        {L"type 0x55", 0x55, Bytes{1, 2}},
    };
    return samples;
}

} // namespace ut::test
