#include <algorithm>
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/file_search.h>
#include <ut/platform/text.h>

#include "support/temp_folder.h"

namespace {

// Name, whether a folder, size (0 for a folder on every home).
using Entry = std::tuple<std::wstring, bool, DWORD>;

// Everything a search finds, sorted by name; empty when it finds nothing.
std::vector<Entry> FindAll(const std::wstring& name) {
    WIN32_FIND_DATAW found{};
    ut::platform::UniqueFind search(FindFirstFileW(name.c_str(), &found));
    std::vector<Entry> entries;
    if (!search.Valid())
        return entries;
    do {
        entries.push_back(
            {found.cFileName, (found.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0, found.nFileSizeLow});
    } while (FindNextFileW(search.Get(), &found));
    std::sort(entries.begin(), entries.end());
    return entries;
}

TEST(FileSearch, FindsOneEntryByNameAndListsAFoldersMatches) {
    ut::test::TempFolder temp;
    temp.Write(L"a.avi", "12345");
    temp.Write(L"b.avi", "");
    temp.Write(L"c.txt", "1");
    temp.MakeFolder(L"sub");
    struct Case {
        std::wstring name;
        std::vector<Entry> expected;
    };
    const Case cases[] = {
        {temp.Path(L"a.avi"), {{L"a.avi", false, 5}}},
        {temp.Path(L"sub"), {{L"sub", true, 0}}},
        {temp.Path(), {{temp.Path().substr(temp.Path().find_last_of(L"/\\") + 1), true, 0}}},
        {temp.Path(L"*.avi"), {{L"a.avi", false, 5}, {L"b.avi", false, 0}}},
        {temp.Path(L"?.txt"), {{L"c.txt", false, 1}}},
        // clang-format off
        {temp.Path(L"*"), {{L".", true, 0}, {L"..", true, 0}, {L"a.avi", false, 5}, {L"b.avi", false, 0},
                           {L"c.txt", false, 1}, {L"sub", true, 0}}},
        // clang-format on
        {temp.Path(L"*.mov"), {}},
        {temp.Path(L"missing"), {}},
        {temp.Path(L"missing") + L"/*", {}},
        {L"", {}},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(FindAll(c.name), c.expected) << ut::platform::Utf8FromWide(c.name);
    }
}

} // namespace
