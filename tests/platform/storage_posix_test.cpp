// What only POSIX's own compound files promise: damaged files refused, atomic commits, the system's bytes.
#include <chrono>
#include <csignal>
#include <filesystem>
#include <string>
#include <sys/stat.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/storage.h>

#include "support/compound.h"
#include "support/temp_folder.h"

namespace {

using namespace ut::test;
using ut::ComPtr;

HRESULT Open(const std::wstring& path, ComPtr<IStorage>& storage, DWORD mode = kReadMode) {
    return StgOpenStorage(path.c_str(), nullptr, mode, nullptr, 0, storage.Put());
}

ComPtr<IStorage> Created(const std::wstring& path) {
    ComPtr<IStorage> storage;
    EXPECT_EQ(StgCreateDocfile(path.c_str(), kCreateMode, 0, storage.Put()), S_OK);
    return storage;
}

// The bytes of a compound file, with the places a test damages found by name.
struct RawFile {
    std::uint32_t Get32(std::size_t at) const {
        std::uint32_t value = 0;
        for (int i = 3; i >= 0; --i)
            value = value << 8 | static_cast<std::uint8_t>(bytes[at + i]);
        return value;
    }
    // Writes the `size` low bytes of `value`, little-endian.
    void Put(std::size_t at, std::uint32_t value, int size = 4) {
        for (int i = 0; i < size; ++i)
            bytes[at + i] = static_cast<char>(value >> (8 * i));
    }
    // The directory entry named `name`: entries are 128 bytes, aligned, after the header.
    std::size_t Entry(const std::string& name) const {
        std::string utf16;
        for (char c : name)
            utf16 += std::string{c, '\0'};
        for (std::size_t at = 512; at + 128 <= bytes.size(); at += 128)
            if (bytes.compare(at, utf16.size() + 2, utf16 + std::string(2, '\0')) == 0 &&
                static_cast<std::uint8_t>(bytes[at + 64]) == utf16.size() + 2)
                return at;
        ADD_FAILURE() << "no entry " << name;
        return 0;
    }
    // The FAT slot of the first sector of `name`'s chain, in the first FAT sector.
    std::size_t FirstFatSlot(const std::string& name) const {
        return (Get32(76) + 1) * 512 + 4 * Get32(Entry(name) + 116);
    }

    std::string bytes;
};

// A small file: a regular stream "big", a mini stream "small" and a storage "sub".
std::string SampleBytes(const TempFolder& folder) {
    std::wstring path = folder / L"good.cfb";
    {
        ComPtr<IStorage> root = Created(path), sub;
        EXPECT_EQ(PutStream(root.Get(), L"big", Pattern(8192, 1)), S_OK);
        EXPECT_EQ(PutStream(root.Get(), L"small", Pattern(100, 2)), S_OK);
        EXPECT_EQ(root->CreateStorage(L"sub", kElementMode, 0, 0, sub.Put()), S_OK);
        EXPECT_EQ(PutStream(sub.Get(), L"in", "x"), S_OK);
    }
    return FileContent(path);
}

// What opening the file, then reading "big" and "small" whole, answers.
enum Step { kOpen, kReadBig, kReadSmall };

struct Damage {
    const char* what;
    Step fails;
    HRESULT code;
    void (*apply)(RawFile& file);
};

// clang-format off
const Damage kDamages[] = {
    {"byte order", kOpen, STG_E_INVALIDHEADER, [](RawFile& f) { f.Put(28, 0x1234, 2); }},
    {"sector shift", kOpen, STG_E_INVALIDHEADER, [](RawFile& f) { f.Put(30, 20, 2); }},
    {"major version", kOpen, STG_E_INVALIDHEADER, [](RawFile& f) { f.Put(26, 7, 2); }},
    {"mini sector shift", kOpen, STG_E_INVALIDHEADER, [](RawFile& f) { f.Put(32, 7, 2); }},
    {"FAT count past the file", kOpen, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(44, 0x7FFFFFFF); }},
    {"directory past the file", kOpen, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(48, 0x00FFFFFF); }},
    {"truncated", kOpen, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.bytes.resize(1024); }},
    {"sibling back to the root", kOpen, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(f.Entry("small") + 72, 0); }},
    {"sibling past the directory", kOpen, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(f.Entry("small") + 72, 5000); }},
    {"odd name length", kOpen, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(f.Entry("small") + 64, 7, 2); }},
    {"unknown type", kOpen, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.bytes[f.Entry("small") + 66] = 9; }},
    {"stream with elements", kOpen, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(f.Entry("small") + 76, 0); }},
    {"stream larger than the file", kReadBig, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(f.Entry("big") + 120, 0x7FFFFFF0); }},
    {"chain in a loop", kReadBig, STG_E_DOCFILECORRUPT,
     [](RawFile& f) { f.Put(f.FirstFatSlot("big"), f.Get32(f.Entry("big") + 116)); }},
    {"chain into a free sector", kReadBig, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(f.FirstFatSlot("big"), 0xFFFFFFFF); }},
    {"mini chain past the mini stream", kReadSmall, STG_E_DOCFILECORRUPT, [](RawFile& f) { f.Put(f.Entry("small") + 116, 10000); }},
};
// clang-format on

HRESULT ReadResult(IStorage* root, const wchar_t* name) {
    ComPtr<IStream> stream;
    if (HRESULT hr = root->OpenStream(name, nullptr, kReadMode, 0, stream.Put()); FAILED(hr))
        return hr;
    char buffer[512];
    ULONG got = 0;
    HRESULT hr = S_OK;
    while (SUCCEEDED(hr = stream->Read(buffer, sizeof buffer, &got)) && got > 0) {
    }
    return hr;
}

TEST(StoragePosix, DamagedFilesAreRefusedWithTheSystemsCodes) {
    TempFolder folder;
    std::string good = SampleBytes(folder);
    ASSERT_GT(good.size(), 2048u);
    for (const Damage& damage : kDamages) {
        RawFile file{good};
        damage.apply(file);
        ComPtr<IStorage> root;
        auto expected = [&](Step step) { return damage.fails == step ? damage.code : S_OK; };
        ASSERT_EQ(Open(folder.Write(L"damaged.cfb", file.bytes), root), expected(kOpen)) << damage.what;
        if (!root)
            continue;
        EXPECT_EQ(ReadResult(root.Get(), L"big"), expected(kReadBig)) << damage.what;
        EXPECT_EQ(ReadResult(root.Get(), L"small"), expected(kReadSmall)) << damage.what;
    }
}

TEST(StoragePosix, NamesTheSystemForbidsAreRefused) {
    TempFolder folder;
    ComPtr<IStorage> root = Created(folder / L"names.cfb");
    ASSERT_TRUE(root);
    for (const wchar_t* name : {L"x/y", L"x\\y", L"x:y", L"x!y", L""}) {
        ComPtr<IStream> stream;
        EXPECT_EQ(root->CreateStream(name, kElementMode, 0, 0, stream.Put()), STG_E_INVALIDNAME) << name;
        EXPECT_EQ(root->RenameElement(L"any", name), STG_E_INVALIDNAME) << name;
    }
    EXPECT_EQ(StgCreateDocfile(L"", kCreateMode, 0, root.Put()), STG_E_INVALIDNAME);
    EXPECT_EQ(StgCreateDocfile((folder / L"no/such/folder.cfb").c_str(), kCreateMode, 0, root.Put()),
              STG_E_PATHNOTFOUND);
}

TEST(StoragePosix, StateBitsTimesAndClassIdsRoundTrip) {
    TempFolder folder;
    std::wstring path = folder / L"attributes.cfb";
    constexpr CLSID kClass = {0x01020304, 0x0506, 0x0708, {9, 10, 11, 12, 13, 14, 15, 16}};
    const FILETIME created{0x11111111, 0x01D00000}, modified{0x22222222, 0x01D10000};
    {
        ComPtr<IStorage> root = Created(path), sub;
        ASSERT_TRUE(root);
        ASSERT_EQ(root->SetStateBits(0xF0F0, 0xFFFF), S_OK);
        ASSERT_EQ(root->CreateStorage(L"sub", kElementMode, 0, 0, sub.Put()), S_OK);
        ASSERT_EQ(sub->SetClass(kClass), S_OK);
        ASSERT_EQ(sub->SetStateBits(0x5, 0xF), S_OK);
        ASSERT_EQ(root->SetElementTimes(L"sub", &created, nullptr, &modified), S_OK);
        EXPECT_EQ(root->SetElementTimes(L"missing", &created, nullptr, &modified), STG_E_FILENOTFOUND);
    }
    ComPtr<IStorage> root;
    ASSERT_EQ(Open(path, root), S_OK);
    STATSTG stat{};
    ASSERT_EQ(root->Stat(&stat, STATFLAG_NONAME), S_OK);
    EXPECT_EQ(stat.grfStateBits, 0xF0F0u);
    ComPtr<IEnumSTATSTG> list;
    ASSERT_EQ(root->EnumElements(0, nullptr, 0, list.Put()), S_OK);
    ASSERT_EQ(list->Next(1, &stat, nullptr), S_OK);
    CoTaskMemFree(stat.pwcsName);
    EXPECT_TRUE(IsEqualGUID(stat.clsid, kClass));
    EXPECT_EQ(stat.grfStateBits, 0x5u);
    EXPECT_EQ(stat.ctime.dwLowDateTime, created.dwLowDateTime);
    EXPECT_EQ(stat.mtime.dwHighDateTime, modified.dwHighDateTime);
    EXPECT_EQ(root->SetClass(kClass), STG_E_ACCESSDENIED);
    EXPECT_EQ(root->SetStateBits(1, 1), STG_E_ACCESSDENIED);
    EXPECT_EQ(root->Commit(STGC_DEFAULT), STG_E_ACCESSDENIED);
}

// libgsf links a storage's elements as one list, which its reader follows recursively: a written
// directory must be relinked as balanced trees. Commits keep permissions and leave nothing beside.
TEST(StoragePosix, ManyElementsReadBackAndCommitsKeepPermissions) {
    TempFolder folder;
    std::wstring path = folder / L"many.cfb";
    constexpr int kCount = 5000;
    {
        ComPtr<IStorage> root = Created(path);
        ASSERT_TRUE(root);
        for (int i = 0; i < kCount; ++i)
            ASSERT_EQ(PutStream(root.Get(), (L"s" + std::to_wstring(i)).c_str(), std::to_string(i)), S_OK);
    }
    std::filesystem::path file(path);
    std::filesystem::permissions(file, std::filesystem::perms(0640));
    ComPtr<IStorage> root;
    ASSERT_EQ(Open(path, root, kElementMode), S_OK);
    ASSERT_EQ(PutStream(root.Get(), L"data", "changed"), S_OK);
    ASSERT_EQ(root->Commit(STGC_DEFAULT), S_OK);
    ASSERT_EQ(Open(path, root), S_OK);
    EXPECT_EQ(ElementsOf(root.Get()).size(), static_cast<std::size_t>(kCount + 1));
    EXPECT_EQ(ReadStream(root.Get(), L"s4321"), "4321");
    EXPECT_EQ(std::filesystem::status(file).permissions(), std::filesystem::perms(0640));
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder.Root()), {}), 1);
}

// Bytes the system itself wrote: class ids, streams large, small and empty, and a sub-storage.
TEST(StoragePosix, ReadsWhatTheSystemWrites) {
    std::wstring path =
        (std::filesystem::path(UT_SOURCE_DIR) / "tests/platform/data/system_written.cfb").wstring();
    ComPtr<IStorage> root;
    ASSERT_EQ(Open(path, root), S_OK);
    constexpr CLSID kRoot = {0x12345678, 0x9ABC, 0xDEF0, {1, 2, 3, 4, 5, 6, 7, 8}};
    constexpr CLSID kSub = {0xAABBCCDD, 0x1122, 0x3344, {9, 8, 7, 6, 5, 4, 3, 2}};
    EXPECT_TRUE(IsEqualGUID(ClassOf(root.Get()), kRoot));
    std::vector<Element> expected = {{L"Big", STGTY_STREAM, 10000},
                                     {L"Sub", STGTY_STORAGE, 0},
                                     {L"Empty", STGTY_STREAM, 0},
                                     {L"Contents", STGTY_STREAM, 100}};
    EXPECT_EQ(ElementsOf(root.Get()), expected);
    EXPECT_EQ(ReadStream(root.Get(), L"Big"), Pattern(10000, 2));
    EXPECT_EQ(ReadStream(root.Get(), L"Contents"), Pattern(100, 1));
    ComPtr<IStorage> sub;
    ASSERT_EQ(root->OpenStorage(L"Sub", nullptr, kReadMode, nullptr, 0, sub.Put()), S_OK);
    EXPECT_TRUE(IsEqualGUID(ClassOf(sub.Get()), kSub));
    EXPECT_EQ(ReadStream(sub.Get(), L"Inner"), Pattern(5, 4));
}

// The size of a file that process `pid` has open in `folder` and that is not `except`, or 0:
// the next file, nameless while it is written.
std::uintmax_t OpenFileSizeIn(pid_t pid, const std::filesystem::path& folder, const std::string& except) {
    std::error_code error;
    for (const auto& entry :
         std::filesystem::directory_iterator("/proc/" + std::to_string(pid) + "/fd", error)) {
        std::filesystem::path target = std::filesystem::read_symlink(entry.path(), error);
        if (error || target.parent_path() != folder || target.filename() == except)
            continue;
        struct stat info {};
        if (::stat(entry.path().c_str(), &info) == 0 && S_ISREG(info.st_mode))
            return static_cast<std::uintmax_t>(info.st_size);
    }
    return 0;
}

// A writer killed while it writes the next file leaves the old file whole and nothing beside it.
TEST(StoragePosix, AWriterKilledWhileWritingLeavesTheOldFileIntactAndNothingBeside) {
    TempFolder folder;
    std::wstring path = folder / L"crash.cfb";
    ASSERT_EQ(PutStream(Created(path).Get(), L"old", Pattern(1000, 1)), S_OK);
    std::string before = FileContent(std::filesystem::path(path));
    pid_t writer = ::fork();
    ASSERT_GE(writer, 0);
    if (writer == 0) {
        ComPtr<IStorage> root;
        if (FAILED(Open(path, root, kElementMode)))
            ::_exit(2);
        for (int i = 0;; ++i) { // commit after commit until killed
            (void)PutStream(root.Get(), (L"big" + std::to_wstring(i % 4)).c_str(),
                            std::string(64 << 20, 'x'));
            (void)root->Commit(STGC_DEFAULT);
        }
    }
    // Wait until the writer holds part of the next file.
    std::filesystem::path watched = std::filesystem::canonical(folder.Root());
    bool caught = false;
    for (auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(120);
         !(caught = OpenFileSizeIn(writer, watched, "crash.cfb") > (1u << 20)) &&
         std::chrono::steady_clock::now() < deadline;)
        std::this_thread::sleep_for(std::chrono::microseconds(200));
    ::kill(writer, SIGKILL);
    int status = 0;
    ::waitpid(writer, &status, 0);
    ASSERT_TRUE(caught) << "the writer never started the next file";
    EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
    std::string after = FileContent(std::filesystem::path(path));
    ComPtr<IStorage> root;
    ASSERT_EQ(Open(path, root), S_OK);
    EXPECT_EQ(ReadStream(root.Get(), L"old"), Pattern(1000, 1));
    // Either the old file or one whole commit of the writer, never a mix.
    if (after == before) {
        EXPECT_EQ(ElementsOf(root.Get()).size(), 1u);
    }
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder.Root()), {}), 1);
}

} // namespace
