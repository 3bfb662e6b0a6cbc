// Temporary names, file search, deletion, access tests and path splitting, alike on both homes.
#include <algorithm>
#include <array>
#include <cwctype>
#include <filesystem>
#include <string>
#include <tuple>
#include <utility>

#include <gtest/gtest.h>

#include <ut/platform/files.h>

#include "support/temp_folder.h"

namespace {

using ut::test::TempFolder;

std::wstring Lower(std::wstring text) {
    std::transform(text.begin(), text.end(), text.begin(),
                   [](wchar_t c) { return static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c))); });
    return text;
}

TEST(Files, TheTemporaryFolderEndsWithASeparatorAndSaysWhatRoomItNeeds) {
    wchar_t folder[MAX_PATH];
    DWORD length = GetTempPathW(MAX_PATH, folder);
    ASSERT_GT(length, 0u);
    ASSERT_LT(length, MAX_PATH);
    EXPECT_EQ(std::wstring(folder).size(), length);
    EXPECT_TRUE(folder[length - 1] == L'\\' || folder[length - 1] == L'/');
    EXPECT_TRUE(std::filesystem::is_directory(std::filesystem::path(folder)));
    wchar_t tiny[2] = {L'?', L'?'};
    EXPECT_EQ(GetTempPathW(2, tiny), length + 1);
}

TEST(Files, TemporaryNamesAreNewFilesUnlessTheNumberIsGiven) {
    TempFolder folder;
    std::wstring path = folder.Root().wstring();
    wchar_t first[MAX_PATH], second[MAX_PATH];
    ASSERT_NE(GetTempFileNameW(path.c_str(), L"K3D", 0, first), 0u);
    ASSERT_NE(GetTempFileNameW(path.c_str(), L"K3D", 0, second), 0u);
    EXPECT_NE(std::wstring(first), std::wstring(second));
    for (const wchar_t* name : {first, second}) {
        std::filesystem::path file(name);
        EXPECT_TRUE(std::filesystem::exists(file)) << file;
        EXPECT_EQ(std::filesystem::file_size(file), 0u);
        EXPECT_EQ(Lower(file.filename().wstring()).substr(0, 3), L"k3d");
        EXPECT_EQ(Lower(file.extension().wstring()), L".tmp");
        EXPECT_EQ(std::filesystem::equivalent(file.parent_path(), folder.Root()), true);
    }
    wchar_t formed[MAX_PATH];
    EXPECT_EQ(GetTempFileNameW(path.c_str(), L"K3DX", 0x1A2B, formed), 0x1A2Bu);
    std::filesystem::path named(formed);
    EXPECT_EQ(Lower(named.filename().wstring()), L"k3d1a2b.tmp");
    EXPECT_FALSE(std::filesystem::exists(named));
    std::wstring missing = (folder.Root() / "missing").wstring();
    EXPECT_EQ(GetTempFileNameW(missing.c_str(), L"K3D", 0, formed), 0u);
}

TEST(Files, DeletingAndAccessFollowTheSystemsAnswers) {
    TempFolder folder;
    std::filesystem::path file = folder.Write(L"file.bin", ""), readOnly = folder.Write(L"read_only.bin", "");
    std::filesystem::permissions(readOnly, std::filesystem::perms(0444));
    std::filesystem::path missing = folder.Root() / "missing.bin";
    const std::tuple<std::filesystem::path, int, int> cases[] = {
        // path, mode, answer
        {file, 0, 0},     {file, 2, 0},      {file, 4, 0},      {file, 6, 0},     {readOnly, 0, 0},
        {readOnly, 4, 0}, {readOnly, 2, -1}, {readOnly, 6, -1}, {missing, 0, -1}, {folder.Root(), 0, 0},
    };
    for (const auto& [path, mode, expected] : cases)
        EXPECT_EQ(_waccess(path.wstring().c_str(), mode), expected) << path << " mode " << mode;

    EXPECT_TRUE(DeleteFileW(file.wstring().c_str()));
    EXPECT_FALSE(std::filesystem::exists(file));
    EXPECT_FALSE(DeleteFileW(missing.wstring().c_str()));
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_FILE_NOT_FOUND));
    std::filesystem::permissions(readOnly, std::filesystem::perms::owner_all);
}

TEST(Files, SplitsPathsIntoDriveFolderNameAndExtension) {
    using Parts = std::array<std::wstring, 4>; // drive, folder, name, extension
    const std::pair<const wchar_t*, Parts> cases[] = {
        // clang-format off
        {L"C:\\dir\\sub\\name.ext", {L"C:", L"\\dir\\sub\\", L"name", L".ext"}}, {L"name", {L"", L"", L"name", L""}},
        {L"dir/a.b.c", {L"", L"dir/", L"a.b", L".c"}}, {L"dir\\.hidden", {L"", L"dir\\", L"", L".hidden"}},
        {L"C:", {L"C:", L"", L"", L""}}, {L"dir\\", {L"", L"dir\\", L"", L""}},
        {L"a.dir\\name", {L"", L"a.dir\\", L"name", L""}}, {L"", {L"", L"", L"", L""}},
        // clang-format on
    };
    for (const auto& [path, expected] : cases) {
        wchar_t drive[_MAX_DRIVE], dir[_MAX_DIR], name[_MAX_FNAME], extension[_MAX_EXT];
        _wsplitpath(path, drive, dir, name, extension);
        EXPECT_EQ((Parts{drive, dir, name, extension}), expected) << path;
    }
    wchar_t extension[_MAX_EXT];
    _wsplitpath(L"only\\the.ext", nullptr, nullptr, nullptr, extension);
    EXPECT_STREQ(extension, L".ext");
}

} // namespace
