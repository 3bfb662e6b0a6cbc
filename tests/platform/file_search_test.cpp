#include <algorithm>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/file_search.h>
#include <ut/platform/text.h>

#include "support/temp_folder.h"

namespace {

struct Entry {
    std::wstring name;
    bool folder;
    DWORD size;
    bool operator==(const Entry&) const = default;
    bool operator<(const Entry& other) const { return name < other.name; }
};

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
        {temp.Path(L"*"),
         {{L".", true, 0},
          {L"..", true, 0},
          {L"a.avi", false, 5},
          {L"b.avi", false, 0},
          {L"c.txt", false, 1},
          {L"sub", true, 0}}},
        {temp.Path(L"*.mov"), {}},
        {temp.Path(L"missing"), {}},
        {temp.Path(L"missing") + L"/*", {}},
        {L"", {}},
    };
    for (const Case& c : cases) {
        std::vector<Entry> found = FindAll(c.name);
        // Folders report no size of their own on every home.
        for (Entry& entry : found)
            if (entry.folder)
                entry.size = 0;
        EXPECT_EQ(found, c.expected) << ut::platform::Utf8FromWide(c.name);
    }
}

} // namespace
