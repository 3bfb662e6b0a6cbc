// Opens arbitrary bytes as a compound file and walks everything in it: every storage's list,
// every element's Stat, every stream read to its end. Nothing may crash, hang or read outside
// the input, and a refusal must be one of the storage codes.
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include <ut/platform/storage.h>

namespace {

constexpr int kMaxDepth = 8;
constexpr int kMaxElements = 4000;
constexpr ULONG kMaxStreamRead = 1 << 20;
constexpr DWORD kRead = STGM_READ | STGM_SHARE_EXCLUSIVE;

bool IsStorageCode(HRESULT hr) {
    return (static_cast<std::uint32_t>(hr) & 0xFFFF0000u) == 0x80030000u || hr == E_OUTOFMEMORY;
}

void Check(HRESULT hr) {
    if (FAILED(hr) && !IsStorageCode(hr))
        std::abort(); // a refusal that the storage calls never give
}

void ReadStream(IStorage* storage, const wchar_t* name) {
    ut::ComPtr<IStream> stream;
    HRESULT hr = storage->OpenStream(name, nullptr, kRead, 0, stream.Put());
    Check(hr);
    if (FAILED(hr))
        return;
    static char buffer[65536];
    ULONG total = 0;
    ULONG got = 0;
    while (total < kMaxStreamRead && SUCCEEDED(hr = stream->Read(buffer, sizeof buffer, &got)) && got > 0)
        total += got;
    Check(hr);
    STATSTG stat{};
    Check(stream->Stat(&stat, STATFLAG_NONAME));
}

void Walk(IStorage* storage, int depth, int& elements) {
    ut::ComPtr<IEnumSTATSTG> list;
    HRESULT hr = storage->EnumElements(0, nullptr, 0, list.Put());
    Check(hr);
    STATSTG stat{};
    while (SUCCEEDED(hr) && list->Next(1, &stat, nullptr) == S_OK) {
        if (++elements <= kMaxElements) {
            if (stat.type == STGTY_STREAM) {
                ReadStream(storage, stat.pwcsName);
            } else if (stat.type == STGTY_STORAGE && depth < kMaxDepth) {
                ut::ComPtr<IStorage> inner;
                HRESULT opened = storage->OpenStorage(stat.pwcsName, nullptr, kRead, nullptr, 0, inner.Put());
                Check(opened);
                if (SUCCEEDED(opened))
                    Walk(inner.Get(), depth + 1, elements);
            }
        }
        CoTaskMemFree(stat.pwcsName);
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ut::ComPtr<ILockBytes> bytes;
    if (FAILED(CreateILockBytesOnHGlobal(nullptr, TRUE, bytes.Put())))
        return 0;
    ULARGE_INTEGER start{};
    if (size && FAILED(bytes->WriteAt(start, data, static_cast<ULONG>(size), nullptr)))
        return 0;
    Check(StgIsStorageILockBytes(bytes.Get()));
    ut::ComPtr<IStorage> root;
    HRESULT hr = StgOpenStorageOnILockBytes(bytes.Get(), nullptr, kRead, nullptr, 0, root.Put());
    Check(hr);
    if (FAILED(hr))
        return 0;
    STATSTG stat{};
    Check(root->Stat(&stat, STATFLAG_NONAME));
    int elements = 0;
    Walk(root.Get(), 0, elements);
    return 0;
}
