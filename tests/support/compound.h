// The compound-file helpers that the storage tests share: modes, contents, element lists.
#pragma once

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/storage.h>

namespace ut::test {

inline constexpr DWORD kCreateMode = STGM_CREATE | STGM_READWRITE | STGM_SHARE_EXCLUSIVE;
inline constexpr DWORD kReadMode = STGM_READ | STGM_SHARE_EXCLUSIVE;
inline constexpr DWORD kElementMode = STGM_READWRITE | STGM_SHARE_EXCLUSIVE;

// Content of `size` bytes that differs with `seed`.
inline std::string Pattern(std::size_t size, int seed) {
    std::string bytes(size, '\0');
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<char>(i * 7 + static_cast<std::size_t>(seed));
    return bytes;
}

inline HRESULT PutStream(IStorage* storage, const wchar_t* name, const std::string& bytes) {
    ComPtr<IStream> stream;
    HRESULT hr = storage->CreateStream(name, kElementMode | STGM_CREATE, 0, 0, stream.Put());
    if (FAILED(hr))
        return hr;
    return bytes.empty() ? S_OK : stream->Write(bytes.data(), static_cast<ULONG>(bytes.size()), nullptr);
}

inline std::string ReadStream(IStorage* storage, const wchar_t* name) {
    ComPtr<IStream> stream;
    EXPECT_EQ(storage->OpenStream(name, nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, 0, stream.Put()), S_OK)
        << name;
    std::string bytes;
    char chunk[4096];
    ULONG got = 0;
    while (stream && SUCCEEDED(stream->Read(chunk, sizeof chunk, &got)) && got > 0)
        bytes.append(chunk, got);
    return bytes;
}

struct Element {
    std::wstring name;
    DWORD type;
    ULONGLONG size;
    bool operator==(const Element&) const = default;
};

// The elements of a storage in the order its list gives them.
inline std::vector<Element> ElementsOf(IStorage* storage) {
    std::vector<Element> elements;
    ComPtr<IEnumSTATSTG> list;
    EXPECT_EQ(storage->EnumElements(0, nullptr, 0, list.Put()), S_OK);
    STATSTG stat{};
    while (list && list->Next(1, &stat, nullptr) == S_OK) {
        elements.push_back({stat.pwcsName, stat.type, stat.cbSize.QuadPart});
        CoTaskMemFree(stat.pwcsName);
    }
    return elements;
}

inline CLSID ClassOf(IStorage* storage) {
    STATSTG stat{};
    EXPECT_EQ(storage->Stat(&stat, STATFLAG_NONAME), S_OK);
    return stat.clsid;
}

} // namespace ut::test
