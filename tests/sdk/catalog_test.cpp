// Text tables, catalogs and logging; module registry keys and string dictionaries.
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ut/detail/names.h>
#include <ut/platform/process.h>
#include <ut/sdk/catalog.h>
#include <ut/sdk/log.h>
#include <ut/sdk/resources.h>

#include "support/temp_folder.h"

namespace {

TEST(TextTables, ReadOneNumberedTextALineAndSkipWhatTheyCannotRead) {
    ut::test::TempFolder folder;
    const std::string content = "# a comment\n"
                                "1 plain\n"
                                "2\ttab separated\n"
                                "3    many blanks\n"
                                "4 escapes \\n \\t \\\\ and C:\\dir\\file\n"
                                "5\n"
                                "6 trailing blanks kept  \n"
                                "7 a line ending in CR LF\r\n"
                                " 8 a leading blank\n"
                                "x9 no number\n"
                                "10x no blank after the number\n"
                                "1 replaced\n"
                                "\n"
                                "1234567890 ten digits\n"
                                "0 zero\n"
                                "12 \xC3\xBCn\xC3\xAF \xE2\x82\xAC\n"
                                "13 the last line without a break";
    ASSERT_EQ(KXDictLoadFile(L"UTPARSE", folder.Write(L"parse.dict", content).c_str()), S_OK);
    // clang-format off
    const std::pair<unsigned short, std::wstring> cases[] = {
        {1, L"replaced"}, {2, L"tab separated"}, {3, L"many blanks"},
        {4, L"escapes \n \t \\ and C:\\dir\\file"}, {5, L""}, {6, L"trailing blanks kept  "},
        {7, L"a line ending in CR LF"}, {8, L""}, {9, L""}, {10, L""}, {0, L"zero"},
        {12, L"\u00FCn\u00EF \u20AC"}, {13, L"the last line without a break"}};
    // clang-format on
    for (const auto& [id, text] : cases)
        EXPECT_EQ(std::wstring(DictLoadIdstring(L"UTPARSE", id)), text) << "entry " << id;

    // Reading again replaces the table; texts handed out before stay readable.
    const wchar_t* before = DictLoadIdstring(L"UTPARSE", 1);
    ASSERT_EQ(KXDictLoadFile(L"UTPARSE", folder.Write(L"again.dict", "1 again\n").c_str()), S_OK);
    EXPECT_STREQ(DictLoadIdstring(L"UTPARSE", 1), L"again");
    EXPECT_STREQ(before, L"replaced");
    EXPECT_STREQ(DictLoadIdstring(L"UTPARSE", 2), L"");
}

TEST(TextTables, RefuseWhatCannotBeRead) {
    ut::test::TempFolder folder;
    EXPECT_EQ(KXDictLoadFile(L"UTPARSE", folder.Path(L"missing.dict").c_str()), STG_E_FILENOTFOUND);
    EXPECT_EQ(KXDictLoadFile(L"UTPARSE", nullptr), E_INVALIDARG);
    EXPECT_EQ(KXDictLoadFile(nullptr, L"x"), E_INVALIDARG);
    EXPECT_EQ(KXDictLoadFile(L"", L"x"), E_INVALIDARG);
    EXPECT_EQ(KXCatalogLoadFile(L"", L"x"), E_INVALIDARG);
    EXPECT_STREQ(DictLoadIdstring(L"UTNOSUCHDICTIONARY", 1), L"");
    EXPECT_STREQ(DictLoadIdstring(nullptr, 1), L"");
    EXPECT_STREQ(KXDictLoadInstanceIdstring(nullptr, 1), L"");
}

TEST(LogMessage, WritesOneLineWithTheKindToStandardErrorByDefault) {
    // The kind, text, source and details; the line written.
    const std::tuple<ULONG, const wchar_t*, const wchar_t*, const wchar_t*, std::string> cases[] = {
        {KXLOG_INFO, L"plain", nullptr, nullptr, "info: plain\n"},
        {KXLOG_WARNING, L"two\nlines\r", L"cat 7", nullptr, "warning: two lines  [cat 7]\n"},
        {KXLOG_ERROR, L"failed", L"", L"more", "error: failed more\n"},
        {7, L"odd", nullptr, L"", "kind 7: odd\n"}};
    for (const auto& [kind, text, source, details, line] : cases) {
        testing::internal::CaptureStderr();
        EXPECT_EQ(KXLogMessage(kind, text, source, details), S_OK);
        EXPECT_EQ(testing::internal::GetCapturedStderr(), line);
    }
    EXPECT_EQ(KXLogMessage(KXLOG_INFO, nullptr, nullptr, nullptr), E_POINTER);
}

// Reports from a catalog of the test's own and keeps what it would log.
class CountingHandling : public CKXErrorHandling {
public:
    HRESULT OnCreateMsgMap() override { return ++mapsCreated, S_OK; }
    wchar_t* GetCatalogName() override { return catalog; }
    HRESULT LogMessage(CKXMsgString& message) override {
        return logged.push_back(message.Text().Str()), S_OK;
    }

    wchar_t* catalog = nullptr;
    int mapsCreated = 0;
    std::vector<std::wstring> logged;
};

TEST(ErrorHandling, CreatesItsMapOnceAndReportsThroughTheVirtualLog) {
    ut::test::TempFolder folder;
    ASSERT_EQ(KXCatalogLoadFile(L"utscores", folder.Write(L"s.cat", "1 %ls scored %u%%\n").c_str()), S_OK);
    CountingHandling handling;
    wchar_t name[] = L"utscores";
    const std::pair<wchar_t*, HRESULT> reports[] = {{nullptr, E_FAIL}, {name, S_OK}, {name, S_OK}};
    for (auto [catalog, expected] : reports) {
        handling.catalog = catalog;
        EXPECT_EQ(handling.ReportMsg(1, L"Ann", 90u), expected);
    }
    EXPECT_EQ(handling.ReportMsg(2), KX_E_MSG_NOT_FOUND);
    EXPECT_EQ(handling.mapsCreated, 1);
    EXPECT_EQ(handling.logged, (std::vector<std::wstring>{L"Ann scored 90%", L"Ann scored 90%"}));
}

HINSTANCE ThisExecutable() {
    return ut::platform::ModuleOf(reinterpret_cast<const void*>(&ThisExecutable));
}

TEST(RegistryKey, NamesTheModuleEndsInABackslashAndRefusesWhatItCannotBuild) {
    wchar_t key[ut::kPathCapacity];
    ASSERT_EQ(GWResourceConstructRegKey(ThisExecutable(), L"", key, ut::kPathCapacity), ERROR_SUCCESS);
    EXPECT_STREQ(key, L"Software\\ut\\Modules\\ut_sdk_tests\\");
    ASSERT_EQ(GWResourceConstructRegKey(ThisExecutable(), L"Views", key, ut::kPathCapacity), ERROR_SUCCESS);
    EXPECT_STREQ(key, L"Software\\ut\\Modules\\ut_sdk_tests\\Views\\");
    EXPECT_EQ(GWResourceConstructRegKey(ThisExecutable(), L"", key, 16), ERROR_INSUFFICIENT_BUFFER);
    EXPECT_STREQ(key, L"");
    EXPECT_EQ(GWResourceConstructRegKey(nullptr, L"", key, 16), ERROR_INVALID_PARAMETER);
    EXPECT_EQ(GWResourceConstructRegKey(ThisExecutable(), L"", nullptr, 16), ERROR_INVALID_PARAMETER);
}

TEST(Dictionaries, AreFoundByNameUntilUnregistered) {
    HINSTANCE self = ThisExecutable();
    ASSERT_EQ(KXDictRegisterInstance(self, L"TESTDICT"), S_OK);
    EXPECT_EQ(KXDictFindInstance(L"TESTDICT"), self);
    EXPECT_EQ(KXDictUnregisterInstance(L"TESTDICT"), S_OK);
    EXPECT_EQ(KXDictFindInstance(L"TESTDICT"), nullptr);
    EXPECT_EQ(KXDictUnregisterInstance(L"TESTDICT"), S_FALSE);
    EXPECT_EQ(KXDictRegisterInstance(nullptr, L"TESTDICT"), E_INVALIDARG);
    EXPECT_EQ(KXDictRegisterInstance(self, L""), E_INVALIDARG);
}

} // namespace
