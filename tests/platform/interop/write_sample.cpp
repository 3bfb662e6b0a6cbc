// Writes the compound file that the interoperability tests read with standard tools: a class
// id, streams on both sides of the mini-stream limit, an empty one, a sub-storage with a class id
// and state bits, and enough elements to fill several directory sectors.
#include <cstdio>
#include <string>

#include <ut/platform/storage.h>
#include <ut/platform/text.h>

namespace {

constexpr DWORD kElement = STGM_READWRITE | STGM_SHARE_EXCLUSIVE;

std::string Pattern(std::size_t size, int seed) {
    std::string bytes(size, '\0');
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<char>(i * 7 + static_cast<std::size_t>(seed));
    return bytes;
}

bool Put(IStorage* storage, const wchar_t* name, const std::string& bytes) {
    ut::ComPtr<IStream> stream;
    return SUCCEEDED(storage->CreateStream(name, kElement | STGM_CREATE, 0, 0, stream.Put())) &&
           (bytes.empty() ||
            SUCCEEDED(stream->Write(bytes.data(), static_cast<ULONG>(bytes.size()), nullptr)));
}

bool WriteSample(const std::wstring& path) {
    constexpr CLSID kRoot = {0x12345678, 0x9ABC, 0xDEF0, {1, 2, 3, 4, 5, 6, 7, 8}};
    constexpr CLSID kSub = {0xAABBCCDD, 0x1122, 0x3344, {9, 8, 7, 6, 5, 4, 3, 2}};
    ut::ComPtr<IStorage> root;
    if (FAILED(StgCreateDocfile(path.c_str(), kElement | STGM_CREATE, 0, root.Put())) ||
        FAILED(root->SetClass(kRoot)))
        return false;
    bool written = Put(root.Get(), L"Contents", Pattern(100, 1)) &&
                   Put(root.Get(), L"Big", Pattern(10000, 2)) && Put(root.Get(), L"Empty", "");
    for (int i = 0; written && i < 300; ++i)
        written = Put(root.Get(), (L"n" + std::to_wstring(i)).c_str(), std::to_string(i));
    ut::ComPtr<IStorage> sub;
    written = written && SUCCEEDED(root->CreateStorage(L"Sub", kElement, 0, 0, sub.Put())) &&
              SUCCEEDED(sub->SetClass(kSub)) && SUCCEEDED(sub->SetStateBits(0x5A, 0xFF)) &&
              Put(sub.Get(), L"Inner", Pattern(5, 4));
    sub.Reset();
    return written && SUCCEEDED(root->Commit(STGC_DEFAULT));
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 2)
        return std::fprintf(stderr, "usage: %s FILE\n", argv[0]), 2;
    if (!WriteSample(ut::platform::WideFromUtf8(argv[1])))
        return std::fprintf(stderr, "could not write %s\n", argv[1]), 1;
    return 0;
}
