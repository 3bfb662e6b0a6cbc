// The host's storage calls: byte arrays over files and storages opened or created three ways.
#include <filesystem>
#include <string>

#include <gtest/gtest.h>

#include <ut/sdk/storage.h>

#include "support/compound.h"
#include "support/temp_folder.h"

namespace {

using ut::ComPtr;
using ut::test::kElementMode;
using ut::test::PutStream;
using ut::test::ReadStream;
using ut::test::TempFolder;

// A storage of `name` (a file, or an element of `parent`), opened (`open`) or created, over `bytes`.
HRESULT Storage(IStorage* parent, const std::wstring& name, BOOL open, ComPtr<IStorage>& storage,
                ILockBytes* bytes = nullptr, DWORD mode = kElementMode) {
    return GWOpenOrCreateStorage2(parent, name.c_str(), nullptr, mode, open, storage.Put(), bytes);
}

TEST(HostStorage, ByteArraysOpenOnlyWhatExistsAndCreateAnew) {
    TempFolder folder;
    std::wstring path = folder / L"bytes.cfb";
    ComPtr<ILockBytes> bytes;
    ComPtr<IStorage> storage;
    EXPECT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, TRUE, bytes.Put()), STG_E_FILENOTFOUND);
    EXPECT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, TRUE, nullptr), E_POINTER);
    ASSERT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, FALSE, bytes.Put()), S_OK);
    EXPECT_EQ(
        GWOpenOrCreateStorage2(nullptr, path.c_str(), nullptr, kElementMode, FALSE, nullptr, bytes.Get()),
        E_POINTER);
    ASSERT_EQ(Storage(nullptr, path, FALSE, storage, bytes.Get()), S_OK);
    ASSERT_EQ(PutStream(storage.Get(), L"data", "kept"), S_OK);
    storage.Reset();
    ASSERT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, TRUE, bytes.Put()), S_OK);
    ASSERT_EQ(Storage(nullptr, path, TRUE, storage, bytes.Get()), S_OK);
    EXPECT_EQ(ReadStream(storage.Get(), L"data"), "kept");
    storage.Reset();
    // Creating again replaces the file's content.
    ASSERT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, FALSE, bytes.Put()), S_OK);
    ASSERT_EQ(Storage(nullptr, path, FALSE, storage, bytes.Get()), S_OK);
    ComPtr<IStream> gone;
    EXPECT_EQ(storage->OpenStream(L"data", nullptr, kElementMode, 0, gone.Put()), STG_E_FILENOTFOUND);
}

TEST(HostStorage, StoragesOnFilesAndInsideParents) {
    TempFolder folder;
    ComPtr<IStorage> root, child;
    EXPECT_EQ(Storage(nullptr, folder / L"file.cfb", TRUE, root), STG_E_FILENOTFOUND);
    ASSERT_EQ(Storage(nullptr, folder / L"file.cfb", FALSE, root), S_OK);
    EXPECT_EQ(Storage(root.Get(), L"child", TRUE, child), STG_E_FILENOTFOUND);
    ASSERT_EQ(Storage(root.Get(), L"child", FALSE, child), S_OK);
    ASSERT_EQ(PutStream(child.Get(), L"inner", "deep"), S_OK);
    child.Reset();
    ASSERT_EQ(Storage(root.Get(), L"child", TRUE, child), S_OK);
    EXPECT_EQ(ReadStream(child.Get(), L"inner"), "deep");
}

// A temporary file made for one use goes with the byte array's last reference.
TEST(HostStorage, DeleteOnReleaseIsTheByteArraysToHonour) {
    TempFolder folder;
    std::wstring path = folder / L"scratch.cfb";
    DWORD mode = kElementMode | STGM_DELETEONRELEASE;
    ComPtr<ILockBytes> bytes;
    ComPtr<IStorage> storage;
    ASSERT_EQ(GWOpenOrCreateILockBytes(path.c_str(), mode, FALSE, bytes.Put()), S_OK);
    ASSERT_EQ(Storage(nullptr, path, FALSE, storage, bytes.Get(), mode), S_OK);
    ASSERT_EQ(PutStream(storage.Get(), L"data", "temporary"), S_OK);
    ASSERT_EQ(storage->Commit(STGC_DEFAULT), S_OK);
    EXPECT_TRUE(std::filesystem::exists(std::filesystem::path(path)));
    storage.Reset();
    bytes.Reset();
    EXPECT_FALSE(std::filesystem::exists(std::filesystem::path(path)));
}

} // namespace
