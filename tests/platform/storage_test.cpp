// Compound files must answer alike on both homes: the system's own on Windows, ours on POSIX.
#include <filesystem>
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/storage.h>

#include "support/compound.h"
#include "support/temp_folder.h"
#include "support/wine.h"

namespace {

using namespace ut::test;
using ut::ComPtr;

constexpr CLSID kRootClass = {0x12345678, 0x9ABC, 0xDEF0, {1, 2, 3, 4, 5, 6, 7, 8}};
constexpr CLSID kSubClass = {0xAABBCCDD, 0x1122, 0x3344, {9, 8, 7, 6, 5, 4, 3, 2}};
constexpr std::size_t kSizes[] = {0, 1, 4095, 4096, 4097, 70000};

ComPtr<IStorage> CreateCompound(const std::wstring& path, DWORD mode = kCreateMode) {
    ComPtr<IStorage> storage;
    EXPECT_EQ(StgCreateDocfile(path.c_str(), mode, 0, storage.Put()), S_OK);
    return storage;
}

ComPtr<IStorage> OpenCompound(const std::wstring& path, DWORD mode = kReadMode) {
    ComPtr<IStorage> storage;
    EXPECT_EQ(StgOpenStorage(path.c_str(), nullptr, mode, nullptr, 0, storage.Put()), S_OK);
    return storage;
}

class Storage : public testing::Test {
protected:
    // A file with a class id, streams on both sides of the mini-stream limit and a sub-storage.
    std::wstring Sample() {
        std::wstring path = folder_ / L"sample.cfb";
        ComPtr<IStorage> root = CreateCompound(path), sub;
        if (!root)
            return path;
        EXPECT_EQ(root->SetClass(kRootClass), S_OK);
        for (std::size_t size : kSizes)
            EXPECT_EQ(PutStream(root.Get(), (L"s" + std::to_wstring(size)).c_str(), Pattern(size, 1)), S_OK);
        EXPECT_EQ(root->CreateStorage(L"Sub", kElementMode, 0, 0, sub.Put()), S_OK);
        EXPECT_EQ(sub->SetClass(kSubClass), S_OK);
        EXPECT_EQ(PutStream(sub.Get(), L"Inner", "hello"), S_OK);
        sub.Reset();
        EXPECT_EQ(root->Commit(STGC_DEFAULT), S_OK);
        return path;
    }

    TempFolder folder_;
};

// Read back whole, by two streams in turn that keep their own places, and refusing every change
// while open for reading only.
TEST_F(Storage, WrittenFilesReadBackWithTheirClassIdsSizesAndBytes) {
    std::wstring path = Sample();
    ASSERT_EQ(StgIsStorageFile(path.c_str()), S_OK);
    ComPtr<IStorage> root = OpenCompound(path, STGM_READ | STGM_SHARE_DENY_WRITE);
    ASSERT_TRUE(root);
    EXPECT_TRUE(IsEqualGUID(ClassOf(root.Get()), kRootClass));
    std::vector<Element> expected = {{L"s0", STGTY_STREAM, 0},        {L"s1", STGTY_STREAM, 1},
                                     {L"Sub", STGTY_STORAGE, 0},      {L"s4095", STGTY_STREAM, 4095},
                                     {L"s4096", STGTY_STREAM, 4096},  {L"s4097", STGTY_STREAM, 4097},
                                     {L"s70000", STGTY_STREAM, 70000}};
    EXPECT_EQ(ElementsOf(root.Get()), expected);
    for (std::size_t size : kSizes)
        EXPECT_EQ(ReadStream(root.Get(), (L"s" + std::to_wstring(size)).c_str()), Pattern(size, 1)) << size;
    ComPtr<IStorage> sub;
    ASSERT_EQ(root->OpenStorage(L"Sub", nullptr, kReadMode, nullptr, 0, sub.Put()), S_OK);
    EXPECT_TRUE(IsEqualGUID(ClassOf(sub.Get()), kSubClass));
    EXPECT_EQ(ReadStream(sub.Get(), L"Inner"), "hello");
    sub.Reset();

    ComPtr<IStream> small, large;
    ASSERT_EQ(root->OpenStream(L"s4095", nullptr, kReadMode, 0, small.Put()), S_OK);
    ASSERT_EQ(root->OpenStream(L"s70000", nullptr, kReadMode, 0, large.Put()), S_OK);
    std::string read[2];
    char chunk[100];
    for (ULONG i = 0, got = 0; i < 80; ++i) {
        ASSERT_EQ((i % 2 ? large : small)->Read(chunk, sizeof chunk, &got), S_OK);
        read[i % 2].append(chunk, got);
    }
    EXPECT_EQ(read[0], Pattern(4000, 1));
    EXPECT_EQ(read[1], Pattern(70000, 1).substr(0, 4000));
    large.Reset();

    ComPtr<IStream> stream;
    EXPECT_EQ(root->CreateStream(L"new", kElementMode, 0, 0, stream.Put()), STG_E_ACCESSDENIED);
    EXPECT_EQ(root->DestroyElement(L"s1"), STG_E_ACCESSDENIED);
    EXPECT_EQ(root->OpenStorage(L"Sub", nullptr, kElementMode, nullptr, 0, sub.Put()), STG_E_ACCESSDENIED);
    EXPECT_EQ(small->Write("x", 1, nullptr), STG_E_ACCESSDENIED);
    EXPECT_EQ(small->SetSize(ULARGE_INTEGER{}), STG_E_ACCESSDENIED);
}

TEST_F(Storage, RootModesFollowTheSystemsRules) {
    std::wstring path = folder_ / L"modes.cfb";
    const std::tuple<DWORD, bool, HRESULT> cases[] = {
        // mode, create (else open), answer
        {STGM_CREATE | STGM_READWRITE, true, STG_E_INVALIDFLAG},
        {STGM_CREATE | STGM_READ | STGM_SHARE_EXCLUSIVE, true, STG_E_INVALIDFLAG},
        {STGM_CREATE | STGM_READWRITE | STGM_SHARE_DENY_WRITE, true, STG_E_INVALIDFLAG},
        {STGM_CREATE | STGM_WRITE | STGM_SHARE_EXCLUSIVE, true, S_OK},
        {STGM_CREATE | STGM_READWRITE | STGM_SHARE_DENY_WRITE | STGM_TRANSACTED, true, S_OK},
        {kCreateMode | STGM_CONVERT, true, STG_E_INVALIDFLAG},
        {STGM_READWRITE | STGM_SHARE_EXCLUSIVE, true, STG_E_FILEALREADYEXISTS},
        {STGM_READ, false, STG_E_INVALIDFLAG},
        {STGM_READ | STGM_SHARE_DENY_NONE, false, STG_E_INVALIDFLAG},
        {STGM_READ | STGM_SHARE_DENY_WRITE, false, S_OK},
        {STGM_READWRITE | STGM_SHARE_DENY_WRITE, false, STG_E_INVALIDFLAG},
        {STGM_READWRITE | STGM_SHARE_DENY_WRITE | STGM_TRANSACTED, false, S_OK},
        {STGM_READ | STGM_TRANSACTED, false, S_OK},
        {kReadMode | STGM_CREATE, false, STG_E_INVALIDFLAG},
        {3 | STGM_SHARE_EXCLUSIVE, false, STG_E_INVALIDFLAG},
    };
    ASSERT_TRUE(CreateCompound(path));
    for (const auto& [mode, create, expected] : cases) {
        ComPtr<IStorage> storage;
        HRESULT hr = create ? StgCreateDocfile(path.c_str(), mode, 0, storage.Put())
                            : StgOpenStorage(path.c_str(), nullptr, mode, nullptr, 0, storage.Put());
        EXPECT_EQ(hr, expected) << std::hex << mode << (create ? " create" : " open");
        EXPECT_EQ(storage.Get() != nullptr, SUCCEEDED(hr));
    }
}

TEST_F(Storage, RefusesBadArgumentsAndFilesThatAreNotCompoundFiles) {
    std::wstring path = folder_ / L"file.cfb", folder = folder_.Path();
    ASSERT_TRUE(CreateCompound(path));
    ComPtr<IStorage> storage;
    EXPECT_EQ(StgCreateDocfile(path.c_str(), kCreateMode, 1, storage.Put()), STG_E_INVALIDPARAMETER);
    EXPECT_EQ(StgCreateDocfile(path.c_str(), kCreateMode, 0, nullptr), STG_E_INVALIDPOINTER);
    EXPECT_EQ(StgOpenStorage(path.c_str(), nullptr, kReadMode, nullptr, 1, storage.Put()),
              STG_E_INVALIDPARAMETER);
    EXPECT_EQ(StgOpenStorage(path.c_str(), nullptr, kReadMode, nullptr, 0, nullptr), STG_E_INVALIDPOINTER);
    EXPECT_EQ(StgOpenStorage(nullptr, nullptr, kReadMode, nullptr, 0, storage.Put()), STG_E_INVALIDNAME);
    EXPECT_EQ(StgOpenStorage(folder.c_str(), nullptr, kReadMode, nullptr, 0, storage.Put()),
              STG_E_ACCESSDENIED);
    const std::tuple<const char*, const char*, HRESULT, HRESULT> cases[] = {
        // what, the file's content (null: no file), what StgIsStorageFile and opening answer
        {"text", "just some text, long enough to be mistaken for nothing", S_FALSE, STG_E_FILEALREADYEXISTS},
        {"empty", "", S_FALSE, STG_E_FILEALREADYEXISTS},
        {"signature only", "\xD0\xCF\x11\xE0\xA1\xB1\x1A\xE1", S_OK, STG_E_FILEALREADYEXISTS},
        {"missing", nullptr, STG_E_FILENOTFOUND, STG_E_FILENOTFOUND},
    };
    for (const auto& [what, content, isStorage, open] : cases) {
        std::wstring file = content ? folder_.Write(L"not.cfb", content) : folder_ / L"missing.cfb";
        EXPECT_EQ(StgIsStorageFile(file.c_str()), isStorage) << what;
        EXPECT_EQ(StgOpenStorage(file.c_str(), nullptr, kReadMode, nullptr, 0, storage.Put()), open) << what;
        EXPECT_FALSE(storage);
    }
}

TEST_F(Storage, ElementsFollowTheNamingAndSharingRules) {
    ComPtr<IStorage> root = CreateCompound(folder_ / L"elements.cfb");
    ASSERT_TRUE(root);
    ComPtr<IStream> held, stream;
    ComPtr<IStorage> sub, storage;
    ASSERT_EQ(root->CreateStream(L"a", kElementMode, 0, 0, held.Put()), S_OK);
    ASSERT_EQ(root->CreateStorage(L"sub", kElementMode, 0, 0, sub.Put()), S_OK);
    const std::tuple<const wchar_t*, DWORD, DWORD, HRESULT> creations[] = {
        // name, mode, reserved, answer
        {L"b", STGM_READWRITE, 0, STG_E_INVALIDFLAG},
        {L"a", kElementMode, 0, STG_E_FILEALREADYEXISTS},
        {L"A", kElementMode, 0, STG_E_FILEALREADYEXISTS},
        {L"sub", kElementMode, 0, STG_E_FILEALREADYEXISTS},
        {L"d", kElementMode | STGM_TRANSACTED, 0, STG_E_INVALIDFUNCTION},
        {L"e", kElementMode, 1, STG_E_INVALIDPARAMETER},
        {L"0123456789012345678901234567890", kElementMode, 0, S_OK},
        {L"01234567890123456789012345678901", kElementMode, 0, STG_E_INVALIDNAME},
        {nullptr, kElementMode, 0, STG_E_INVALIDNAME},
    };
    for (const auto& [name, mode, reserved, expected] : creations)
        EXPECT_EQ(root->CreateStream(name, mode, reserved, 0, stream.Put()), expected)
            << (name ? name : L"(null)");
    EXPECT_EQ(root->CreateStream(L"f", kElementMode, 0, 0, nullptr), STG_E_INVALIDPOINTER);
    EXPECT_EQ(root->OpenStream(L"a", nullptr, kElementMode, 0, stream.Put()), STG_E_ACCESSDENIED);
    EXPECT_EQ(root->OpenStream(L"zz", nullptr, kElementMode, 0, stream.Put()), STG_E_FILENOTFOUND);
    EXPECT_EQ(root->OpenStream(L"sub", nullptr, kElementMode, 0, stream.Put()), STG_E_FILENOTFOUND);
    EXPECT_EQ(root->OpenStream(L"a", nullptr, STGM_READWRITE, 0, stream.Put()), STG_E_INVALIDFLAG);
    EXPECT_EQ(root->OpenStorage(L"a", nullptr, kElementMode, nullptr, 0, storage.Put()), STG_E_FILENOTFOUND);
    EXPECT_EQ(root->OpenStorage(L"sub", nullptr, kElementMode, nullptr, 0, storage.Put()),
              STG_E_ACCESSDENIED);
    // Renaming follows the same rules: an open element stays as it is named.
    ASSERT_EQ(PutStream(root.Get(), L"r", "1"), S_OK);
    EXPECT_EQ(root->RenameElement(L"a", L"d"), STG_E_ACCESSDENIED);
    EXPECT_EQ(root->RenameElement(L"nothere", L"x"), STG_E_FILENOTFOUND);
    EXPECT_EQ(root->RenameElement(L"r", L"a"), STG_E_FILEALREADYEXISTS);
    EXPECT_EQ(root->RenameElement(L"r", L"renamed"), S_OK);
    sub.Reset();
    std::vector<Element> expected = {{L"a", STGTY_STREAM, 0},
                                     {L"sub", STGTY_STORAGE, 0},
                                     {L"renamed", STGTY_STREAM, 1},
                                     {L"0123456789012345678901234567890", STGTY_STREAM, 0}};
    EXPECT_EQ(ElementsOf(root.Get()), expected);
    EXPECT_EQ(ReadStream(root.Get(), L"renamed"), "1");
    // Creating over an element replaces it.
    EXPECT_EQ(root->CreateStream(L"a", kElementMode | STGM_CREATE, 0, 0, stream.Put()), S_OK);
}

TEST_F(Storage, DestroyingOrRevertingLeavesTheHoldersReverted) {
    ComPtr<IStorage> root = CreateCompound(folder_ / L"revert.cfb", kCreateMode | STGM_TRANSACTED), sub;
    ASSERT_TRUE(root);
    ComPtr<IStream> inner, stream;
    ASSERT_EQ(root->CreateStorage(L"sub", kElementMode, 0, 0, sub.Put()), S_OK);
    ASSERT_EQ(sub->CreateStream(L"in", kElementMode, 0, 0, inner.Put()), S_OK);
    ASSERT_EQ(root->DestroyElement(L"sub"), S_OK);
    STATSTG stat{};
    EXPECT_EQ(inner->Write("x", 1, nullptr), STG_E_REVERTED);
    EXPECT_EQ(inner->Stat(&stat, STATFLAG_NONAME), STG_E_REVERTED);
    EXPECT_EQ(sub->CreateStream(L"in2", kElementMode, 0, 0, stream.Put()), STG_E_REVERTED);
    EXPECT_EQ(root->DestroyElement(L"sub"), STG_E_FILENOTFOUND);

    ASSERT_EQ(root->CreateStream(L"t", kElementMode, 0, 0, stream.Put()), S_OK);
    ASSERT_EQ(root->Revert(), S_OK);
    EXPECT_EQ(stream->Write("x", 1, nullptr), STG_E_REVERTED);
    EXPECT_TRUE(ElementsOf(root.Get()).empty());
}

// Shorter names first, then by upper-case name; the list's paging follows the system's answers.
TEST_F(Storage, ListsElementsInTheSystemsOrder) {
    ComPtr<IStorage> root = CreateCompound(folder_ / L"order.cfb");
    ASSERT_TRUE(root);
    for (const wchar_t* name : {L"zeta", L"Alpha", L"b", L"BB", L"aa", L"sub2", L"0123456789"})
        ASSERT_EQ(PutStream(root.Get(), name, ""), S_OK);
    std::vector<std::wstring> names;
    for (const Element& element : ElementsOf(root.Get()))
        names.push_back(element.name);
    std::vector<std::wstring> expected = {L"b", L"aa", L"BB", L"sub2", L"zeta", L"Alpha", L"0123456789"};
    EXPECT_EQ(names, expected);

    ComPtr<IEnumSTATSTG> list, clone;
    ASSERT_EQ(root->EnumElements(0, nullptr, 0, list.Put()), S_OK);
    STATSTG page[3];
    ULONG fetched = 0;
    ASSERT_EQ(list->Next(3, page, &fetched), S_OK);
    EXPECT_EQ(fetched, 3u);
    for (ULONG i = 0; i < fetched; ++i)
        CoTaskMemFree(page[i].pwcsName);
    EXPECT_EQ(list->Skip(100), S_FALSE);
    EXPECT_EQ(list->Next(1, page, &fetched), S_FALSE);
    EXPECT_EQ(fetched, 0u);
    EXPECT_EQ(list->Next(2, page, nullptr), E_INVALIDARG);
    ASSERT_EQ(list->Reset(), S_OK);
    ASSERT_EQ(list->Clone(clone.Put()), S_OK);
    ASSERT_EQ(clone->Next(1, page, nullptr), S_OK);
    EXPECT_STREQ(page[0].pwcsName, L"b");
    CoTaskMemFree(page[0].pwcsName);
}

// A transacted root keeps only what was committed; a direct one writes everything on its last release.
TEST_F(Storage, ChangesLastWhenCommittedOrWhenADirectRootGoes) {
    for (bool transacted : {true, false}) {
        std::wstring path = folder_ / (transacted ? L"transacted.cfb" : L"direct.cfb");
        {
            ComPtr<IStorage> root = CreateCompound(path, kCreateMode | (transacted ? STGM_TRANSACTED : 0));
            ASSERT_TRUE(root);
            ASSERT_EQ(PutStream(root.Get(), L"kept", "yes"), S_OK);
            ASSERT_EQ(root->Commit(STGC_DEFAULT), S_OK);
            ASSERT_EQ(PutStream(root.Get(), L"last", "no"), S_OK);
        }
        ComPtr<IStorage> root = OpenCompound(path);
        ASSERT_TRUE(root);
        std::vector<Element> expected = {{L"kept", STGTY_STREAM, 3}};
        if (!transacted)
            expected.push_back({L"last", STGTY_STREAM, 2});
        EXPECT_EQ(ElementsOf(root.Get()), expected) << (transacted ? "transacted" : "direct");
        EXPECT_EQ(ReadStream(root.Get(), L"kept"), "yes");
    }
}

TEST_F(Storage, OpenedForWritingStreamsAreReplacedAddedAndRemoved) {
    std::wstring path = Sample();
    {
        ComPtr<IStorage> root = OpenCompound(path, kElementMode);
        ASSERT_TRUE(root);
        ASSERT_EQ(PutStream(root.Get(), L"s4096", "replaced"), S_OK);
        ASSERT_EQ(PutStream(root.Get(), L"added", Pattern(10000, 3)), S_OK);
        ASSERT_EQ(root->DestroyElement(L"s1"), S_OK);
        ComPtr<IStream> grown;
        ASSERT_EQ(root->OpenStream(L"s4095", nullptr, kElementMode, 0, grown.Put()), S_OK);
        ASSERT_EQ(grown->Seek(LARGE_INTEGER{}, STREAM_SEEK_END, nullptr), S_OK);
        ASSERT_EQ(grown->Write("++", 2, nullptr), S_OK);
        grown.Reset();
        ASSERT_EQ(root->Commit(STGC_DEFAULT), S_OK);
    }
    ComPtr<IStorage> root = OpenCompound(path);
    ASSERT_TRUE(root);
    EXPECT_EQ(ReadStream(root.Get(), L"s4096"), "replaced");
    EXPECT_EQ(ReadStream(root.Get(), L"added"), Pattern(10000, 3));
    EXPECT_EQ(ReadStream(root.Get(), L"s4095"), Pattern(4095, 1) + "++");
    EXPECT_EQ(ReadStream(root.Get(), L"s70000"), Pattern(70000, 1));
    ComPtr<IStream> gone;
    EXPECT_EQ(root->OpenStream(L"s1", nullptr, kReadMode, 0, gone.Put()), STG_E_FILENOTFOUND);
    EXPECT_TRUE(IsEqualGUID(ClassOf(root.Get()), kRootClass));
}

TEST_F(Storage, StatReportsNamesTypesAndModes) {
    ComPtr<IStorage> root = CreateCompound(folder_ / L"stat.cfb"), sub;
    ASSERT_TRUE(root);
    ComPtr<IStream> stream;
    ASSERT_EQ(root->CreateStorage(L"sub", kElementMode, 0, 0, sub.Put()), S_OK);
    ASSERT_EQ(sub->CreateStream(L"data", kElementMode, 0, 0, stream.Put()), S_OK);
    ASSERT_EQ(stream->Write("12345", 5, nullptr), S_OK);
    // The size is checked for streams only: what a storage reports is the home's own.
    const std::tuple<IUnknown*, std::wstring, DWORD, ULONGLONG> cases[] = {
        // object, name's end, type, size
        {root.Get(), L"stat.cfb", STGTY_STORAGE, 0},
        {sub.Get(), L"sub", STGTY_STORAGE, 0},
        {stream.Get(), L"data", STGTY_STREAM, 5},
    };
    for (const auto& [object, nameEnd, type, size] : cases) {
        STATSTG stat{};
        HRESULT hr = type == STGTY_STREAM ? static_cast<IStream*>(object)->Stat(&stat, STATFLAG_DEFAULT)
                                          : static_cast<IStorage*>(object)->Stat(&stat, STATFLAG_DEFAULT);
        ASSERT_EQ(hr, S_OK);
        ASSERT_NE(stat.pwcsName, nullptr);
        std::wstring name = stat.pwcsName;
        CoTaskMemFree(stat.pwcsName);
        EXPECT_TRUE(name.ends_with(nameEnd)) << name;
        EXPECT_EQ(stat.type, type);
        EXPECT_TRUE(type != STGTY_STREAM || stat.cbSize.QuadPart == size) << stat.cbSize.QuadPart;
        EXPECT_EQ(stat.grfMode, kElementMode);
    }
    STATSTG stat{};
    ASSERT_EQ(root->Stat(&stat, STATFLAG_NONAME), S_OK);
    EXPECT_EQ(stat.pwcsName, nullptr);
    EXPECT_TRUE(FAILED(root->Stat(nullptr, STATFLAG_NONAME)));

    // A root without a name is a temporary file that goes with it.
    ASSERT_EQ(StgCreateDocfile(nullptr, kCreateMode | STGM_DELETEONRELEASE, 0, root.Put()), S_OK);
    ASSERT_EQ(root->Stat(&stat, STATFLAG_DEFAULT), S_OK);
    ASSERT_NE(stat.pwcsName, nullptr);
    std::filesystem::path file(stat.pwcsName);
    CoTaskMemFree(stat.pwcsName);
    EXPECT_EQ(stat.grfMode, kElementMode | STGM_DELETEONRELEASE);
    EXPECT_TRUE(std::filesystem::exists(file));
    ASSERT_EQ(PutStream(root.Get(), L"scratch", "x"), S_OK);
    root.Reset();
    EXPECT_FALSE(std::filesystem::exists(file));
}

TEST_F(Storage, CopiesAndMovesElementsBetweenStorages) {
    ComPtr<IStorage> source = OpenCompound(Sample(), kElementMode),
                     target = CreateCompound(folder_ / L"copy.cfb");
    ASSERT_TRUE(source && target);
    ASSERT_EQ(source->CopyTo(0, nullptr, nullptr, target.Get()), S_OK);
    EXPECT_EQ(ElementsOf(target.Get()), ElementsOf(source.Get()));
    EXPECT_TRUE(IsEqualGUID(ClassOf(target.Get()), kRootClass));
    EXPECT_EQ(ReadStream(target.Get(), L"s70000"), Pattern(70000, 1));

    ComPtr<IStorage> sub;
    ASSERT_EQ(source->OpenStorage(L"Sub", nullptr, kElementMode, nullptr, 0, sub.Put()), S_OK);
    EXPECT_EQ(source->CopyTo(0, nullptr, nullptr, sub.Get()), STG_E_ACCESSDENIED);
    if (UnderWine("wine has no MoveElementTo"))
        return;
    ASSERT_EQ(source->MoveElementTo(L"s1", sub.Get(), L"moved", STGMOVE_MOVE), S_OK);
    ASSERT_EQ(source->MoveElementTo(L"s0", sub.Get(), L"copied", STGMOVE_COPY), S_OK);
    std::vector<Element> inSub = {
        {L"Inner", STGTY_STREAM, 5}, {L"moved", STGTY_STREAM, 1}, {L"copied", STGTY_STREAM, 0}};
    EXPECT_EQ(ElementsOf(sub.Get()), inSub);
    ComPtr<IStream> gone;
    EXPECT_EQ(source->OpenStream(L"s1", nullptr, kReadMode, 0, gone.Put()), STG_E_FILENOTFOUND);
    EXPECT_EQ(source->OpenStream(L"s0", nullptr, kReadMode, 0, gone.Put()), S_OK);
}

// Byte arrays in global memory and on files carry compound files too.
TEST_F(Storage, CompoundFilesLiveOnByteArrays) {
    std::wstring path = folder_ / L"bytes.cfb";
    ComPtr<ILockBytes> memory, file;
    ASSERT_EQ(CreateILockBytesOnHGlobal(nullptr, TRUE, memory.Put()), S_OK);
    EXPECT_EQ(ut::platform::OpenFileLockBytes(path.c_str(), STGM_READWRITE, file.Put()), STG_E_FILENOTFOUND);
    EXPECT_EQ(ut::platform::OpenFileLockBytes(nullptr, STGM_READWRITE, file.Put()), STG_E_INVALIDNAME);
    EXPECT_EQ(ut::platform::OpenFileLockBytes(path.c_str(), STGM_READWRITE, nullptr), E_POINTER);
    ASSERT_EQ(ut::platform::OpenFileLockBytes(path.c_str(), STGM_READWRITE | STGM_CREATE, file.Put()), S_OK);
    EXPECT_EQ(StgIsStorageILockBytes(memory.Get()), S_FALSE);
    for (ILockBytes* bytes : {memory.Get(), file.Get()}) {
        SCOPED_TRACE(bytes == file.Get() ? "on a file" : "in memory");
        ComPtr<IStorage> root;
        ASSERT_EQ(StgCreateDocfileOnILockBytes(bytes, kElementMode, 0, root.Put()), S_OK);
        ASSERT_EQ(root->SetClass(kSubClass), S_OK);
        ASSERT_EQ(PutStream(root.Get(), L"data", Pattern(5000, 2)), S_OK);
        ASSERT_EQ(root->Commit(STGC_DEFAULT), S_OK);
    }
    file.Reset();
    EXPECT_EQ(ReadStream(OpenCompound(path).Get(), L"data"), Pattern(5000, 2));

    EXPECT_EQ(StgIsStorageILockBytes(memory.Get()), S_OK);
    ComPtr<IStorage> root;
    EXPECT_EQ(StgOpenStorageOnILockBytes(memory.Get(), nullptr, STGM_READ, nullptr, 0, root.Put()),
              STG_E_INVALIDFLAG);
    EXPECT_EQ(StgOpenStorageOnILockBytes(nullptr, nullptr, kReadMode, nullptr, 0, root.Put()),
              STG_E_INVALIDPOINTER);
    ASSERT_EQ(StgOpenStorageOnILockBytes(memory.Get(), nullptr, kReadMode, nullptr, 0, root.Put()), S_OK);
    EXPECT_TRUE(IsEqualGUID(ClassOf(root.Get()), kSubClass));
    EXPECT_EQ(ReadStream(root.Get(), L"data"), Pattern(5000, 2));
    STATSTG stat{};
    ASSERT_EQ(memory->Stat(&stat, STATFLAG_NONAME), S_OK);
    EXPECT_EQ(stat.type, static_cast<DWORD>(STGTY_LOCKBYTES));
    EXPECT_GE(stat.cbSize.QuadPart, 5000u);

    // A file opened to go with its last reference: reads past its end find nothing.
    ASSERT_EQ(
        ut::platform::OpenFileLockBytes(path.c_str(), STGM_READWRITE | STGM_DELETEONRELEASE, file.Put()),
        S_OK);
    ULARGE_INTEGER at{};
    char signature[8] = {};
    ULONG read = 0;
    ASSERT_EQ(file->ReadAt(at, signature, sizeof signature, &read), S_OK);
    EXPECT_EQ(std::string(signature, read), "\xD0\xCF\x11\xE0\xA1\xB1\x1A\xE1");
    at.QuadPart = 1 << 20;
    EXPECT_EQ(file->ReadAt(at, signature, sizeof signature, &read), S_OK);
    EXPECT_EQ(read, 0u);
    file.Reset();
    EXPECT_FALSE(std::filesystem::exists(std::filesystem::path(path)));
}

} // namespace
