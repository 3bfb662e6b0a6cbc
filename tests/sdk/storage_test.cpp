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

TEST(HostStorage, ByteArraysOpenOnlyWhatExistsAndCreateAnew) {
    TempFolder folder;
    std::wstring path = folder / L"bytes.cfb";
    ComPtr<ILockBytes> bytes;
    EXPECT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, TRUE, bytes.Put()), STG_E_FILENOTFOUND);
    EXPECT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, TRUE, nullptr), E_POINTER);
    ASSERT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, FALSE, bytes.Put()), S_OK);
    ComPtr<IStorage> storage;
    EXPECT_EQ(
        GWOpenOrCreateStorage2(nullptr, path.c_str(), nullptr, kElementMode, FALSE, nullptr, bytes.Get()),
        E_POINTER);
    ASSERT_EQ(GWOpenOrCreateStorage2(nullptr, path.c_str(), nullptr, kElementMode, FALSE, storage.Put(),
                                     bytes.Get()),
              S_OK);
    ASSERT_EQ(PutStream(storage.Get(), L"data", "kept"), S_OK);
    storage.Reset();
    bytes.Reset();

    ASSERT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, TRUE, bytes.Put()), S_OK);
    ASSERT_EQ(GWOpenOrCreateStorage2(nullptr, path.c_str(), nullptr, kElementMode, TRUE, storage.Put(),
                                     bytes.Get()),
              S_OK);
    EXPECT_EQ(ReadStream(storage.Get(), L"data"), "kept");
    storage.Reset();
    bytes.Reset();
    // Creating again replaces the file's content.
    ASSERT_EQ(GWOpenOrCreateILockBytes(path.c_str(), kElementMode, FALSE, bytes.Put()), S_OK);
    ASSERT_EQ(GWOpenOrCreateStorage2(nullptr, path.c_str(), nullptr, kElementMode, FALSE, storage.Put(),
                                     bytes.Get()),
              S_OK);
    ComPtr<IStream> gone;
    EXPECT_EQ(storage->OpenStream(L"data", nullptr, kElementMode, 0, gone.Put()), STG_E_FILENOTFOUND);
}

TEST(HostStorage, StoragesOnFilesAndInsideParents) {
    TempFolder folder;
    std::wstring path = folder / L"file.cfb";
    ComPtr<IStorage> root;
    EXPECT_EQ(GWOpenOrCreateStorage2(nullptr, path.c_str(), nullptr, kElementMode, TRUE, root.Put(), nullptr),
              STG_E_FILENOTFOUND);
    ASSERT_EQ(
        GWOpenOrCreateStorage2(nullptr, path.c_str(), nullptr, kElementMode, FALSE, root.Put(), nullptr),
        S_OK);
    ComPtr<IStorage> child;
    EXPECT_EQ(GWOpenOrCreateStorage2(root.Get(), L"child", nullptr, kElementMode, TRUE, child.Put(), nullptr),
              STG_E_FILENOTFOUND);
    ASSERT_EQ(
        GWOpenOrCreateStorage2(root.Get(), L"child", nullptr, kElementMode, FALSE, child.Put(), nullptr),
        S_OK);
    ASSERT_EQ(PutStream(child.Get(), L"inner", "deep"), S_OK);
    child.Reset();
    ASSERT_EQ(GWOpenOrCreateStorage2(root.Get(), L"child", nullptr, kElementMode, TRUE, child.Put(), nullptr),
              S_OK);
    EXPECT_EQ(ReadStream(child.Get(), L"inner"), "deep");
}

// A temporary file made for one use goes with the byte array's last reference.
TEST(HostStorage, DeleteOnReleaseIsTheByteArraysToHonour) {
    TempFolder folder;
    std::wstring path = folder / L"scratch.cfb";
    DWORD mode = kElementMode | STGM_DELETEONRELEASE;
    ComPtr<ILockBytes> bytes;
    ASSERT_EQ(GWOpenOrCreateILockBytes(path.c_str(), mode, FALSE, bytes.Put()), S_OK);
    ComPtr<IStorage> storage;
    ASSERT_EQ(GWOpenOrCreateStorage2(nullptr, path.c_str(), nullptr, mode, FALSE, storage.Put(), bytes.Get()),
              S_OK);
    ASSERT_EQ(PutStream(storage.Get(), L"data", "temporary"), S_OK);
    ASSERT_EQ(storage->Commit(STGC_DEFAULT), S_OK);
    EXPECT_TRUE(std::filesystem::exists(std::filesystem::path(path)));
    storage.Reset();
    bytes.Reset();
    EXPECT_FALSE(std::filesystem::exists(std::filesystem::path(path)));
}

} // namespace
