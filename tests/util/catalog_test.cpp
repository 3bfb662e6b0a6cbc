#include <cstdint>
#include <cstring>
#include <cwchar>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/catalog.h>
#include <ut/detail/names.h>
#include <ut/host/reference_host.h>
#include <ut/platform/process.h>
#include <ut/platform/text.h>
#include <ut/sdk/dialogs.h>
#include <ut/sdk/resources.h>

#include "support/com_mock.h"
#include "support/temp_folder.h"

namespace {

using TaskString = std::unique_ptr<wchar_t, ut::TaskMemDeleter>;

HINSTANCE ThisProgram() {
    return ut::platform::ModuleOf(reinterpret_cast<const void*>(&ThisProgram));
}

// A dictionary of this program, read from a file and registered under "UTTEST" for the test.
class ProgramDictionary {
public:
    explicit ProgramDictionary(const std::string& content) {
        EXPECT_EQ(KXDictLoadFile(L"UTTEST", folder_.Write(L"UTTEST.dict", content).c_str()), S_OK);
        EXPECT_EQ(KXDictRegisterInstance(ThisProgram(), L"UTTEST"), S_OK);
    }
    ~ProgramDictionary() { KXDictUnregisterInstance(L"UTTEST"); }

private:
    ut::test::TempFolder folder_;
};

TEST(LoadString, CopiesTextsOfAnyLengthAroundEachDoubling) {
    // The first buffer holds 260 characters and counts a text as cut from 258 on.
    const std::size_t lengths[] = {0, 1, 256, 257, 258, 259, 260, 261, 517, 518, 1037, 1038, 3000};
    std::string content;
    for (std::size_t i = 0; i < std::size(lengths); ++i)
        content += std::to_string(100 + i) + " " + std::string(lengths[i], static_cast<char>('a' + i)) + "\n";
    ProgramDictionary dictionary(content);
    for (std::size_t i = 0; i < std::size(lengths); ++i) {
        TaskString text(KXLoadString(ThisProgram(), static_cast<unsigned>(100 + i)));
        ASSERT_NE(text, nullptr);
        EXPECT_EQ(std::wstring(text.get()), std::wstring(lengths[i], static_cast<wchar_t>('a' + i)))
            << lengths[i] << " characters";
    }
    // A missing entry, and a module without a dictionary, give an empty string.
    for (HINSTANCE module : {ThisProgram(), static_cast<HINSTANCE>(nullptr)}) {
        TaskString text(KXLoadString(module, 99));
        ASSERT_NE(text, nullptr);
        EXPECT_STREQ(text.get(), L"");
    }
}

std::wstring Entry(unsigned short id) {
    return DictLoadIdstring(ut::kDictionaryName, id);
}

TEST(CommonDialogError, MapsEveryCodeToItsDictionaryEntry) {
    std::vector<std::pair<DWORD, unsigned short>> cases = {
        {0xFFFF, 6022}, {1, 6024},      {2, 6025},      {3, 6026},      {4, 6050},       {5, 6027},
        {6, 6028},      {7, 6029},      {8, 6030},      {9, 6031},      {10, 6032},      {11, 6033},
        {0x2001, 6045}, {0x3001, 6046}, {0x3002, 6047}, {0x3003, 6048}, {12, 6049},      {0x1000, 6049},
        {0x100C, 6049}, {0x2002, 6049}, {0x3004, 6049}, {0xFFFE, 6049}, {0x10000, 6049},
    };
    for (DWORD code = 0x1001; code <= 0x100B; ++code)
        cases.push_back({code, static_cast<unsigned short>(6034 + code - 0x1001)});
    std::set<std::wstring> texts;
    for (auto [code, entry] : cases) {
        wchar_t buffer[300];
        std::wmemset(buffer, L'#', std::size(buffer));
        KXGetCDError(code, buffer, static_cast<int>(std::size(buffer)));
        EXPECT_EQ(std::wstring(buffer), Entry(entry)) << "code " << code;
        texts.insert(buffer);
    }
    // Every entry from 6022 to 6050 but 6023 has a text of its own.
    EXPECT_EQ(texts.size(), 28u);
    EXPECT_EQ(texts.count(L""), 0u);
    EXPECT_EQ(Entry(6023), L"");
}

TEST(CommonDialogError, CopiesAtMostTheBufferAndLeavesItAloneForCodeZero) {
    const std::wstring text = Entry(6022);
    struct Case {
        DWORD code;
        int size;
        std::wstring expected; // the whole buffer afterwards
    };
    const int length = static_cast<int>(text.size());
    const std::wstring untouched(text.size() + 3, L'#');
    const Case cases[] = {
        {0, length + 3, untouched},
        {0xFFFF, 0, untouched},
        {0xFFFF, -1, untouched},
        {0xFFFF, 5, text.substr(0, 5) + std::wstring(text.size() - 2, L'#')},
        {0xFFFF, length, text + L"###"},
        {0xFFFF, length + 1, text + L'\0' + L"##"},
        {0xFFFF, length + 3, text + std::wstring(3, L'\0')},
    };
    for (const Case& c : cases) {
        std::wstring buffer = untouched;
        KXGetCDError(c.code, buffer.data(), c.size);
        EXPECT_EQ(buffer, c.expected) << "code " << c.code << " size " << c.size;
    }
}

// Keeps what is logged, as "<kind> <text> [<source>]", and answers as it is told.
class LogCapture {
public:
    explicit LogCapture(HRESULT answer = S_OK) : answer_(answer) { KXSetLogSink(&LogCapture::Sink, this); }
    ~LogCapture() { KXSetLogSink(nullptr, nullptr); }

    std::vector<std::wstring> lines;

private:
    static HRESULT Sink(void* self, ULONG kind, const wchar_t* text, const wchar_t* source, const wchar_t*) {
        auto& capture = *static_cast<LogCapture*>(self);
        capture.lines.push_back(std::to_wstring(kind) + L" " + text + L" [" + (source ? source : L"") + L"]");
        return capture.answer_;
    }
    HRESULT answer_;
};

TEST(Catalogs, FormatThenLogAndStopAtTheFirstFailure) {
    const std::wstring longName(1000, L'x');
    C3DCatalog original(L"kxmsgcat"), missing(L"nosuchcat");
    C3DCatalog catalog = original;
    C3DErrorHandling handling, copy = handling;
    EXPECT_STREQ(copy.GetCatalogName(), L"kxmsgcat");
    struct Case {
        HRESULT sinkAnswer;
        std::function<HRESULT()> log;
        HRESULT expected;
        std::wstring logged; // empty: nothing
    };
    // clang-format off
    const Case cases[] = {
        {S_OK, [&] { return catalog.LogMsg(KXLOG_WARNING, 100, L"a.scn"); },
         S_OK, L"1 The file a.scn could not be opened. []"},
        {S_OK, [&] { return catalog.LogMsg(KXLOG_INFO, 300, 5, 1, 3); },
         S_OK, L"0 Frame 5 lies outside the range 1 to 3. []"},
        {S_OK, [&] { return catalog.LogMsg(KXLOG_INFO, 301, 29.97); },
         S_OK, L"0 The scene runs at 29.97 frames a second. []"},
        {S_OK, [&] { return catalog.LogMsg(KXLOG_INFO, 1, longName.c_str()); },
         S_OK, L"0 " + longName + L" []"},
        {S_OK, [&] { return catalog.LogMsg(KXLOG_INFO, 9999); }, KX_E_MSG_NOT_FOUND, L""},
        {S_OK, [&] { return missing.LogMsg(KXLOG_INFO, 100, L"a"); }, STG_E_FILENOTFOUND, L""},
        {E_ACCESSDENIED, [&] { return catalog.LogMsg(KXLOG_ERROR, 100, L"b"); },
         E_ACCESSDENIED, L"2 The file b could not be opened. []"},
        {S_OK, [&] { return copy.ReportMsg(400, 2, 7); },
         S_OK, L"2 2 of 7 objects could not be loaded. [kxmsgcat 400]"},
        {S_OK, [&] { return copy.ReportMsg(9999); }, KX_E_MSG_NOT_FOUND, L""}};
    // clang-format on
    for (const Case& c : cases) {
        LogCapture log(c.sinkAnswer);
        EXPECT_EQ(c.log(), c.expected);
        EXPECT_EQ(log.lines, c.logged.empty() ? std::vector<std::wstring>() : std::vector{c.logged});
    }
}

// Pieces joined as the platform returns a multiple selection: each terminated, then an empty one.
std::wstring Selection(const std::vector<std::wstring>& pieces) {
    std::wstring text;
    for (const std::wstring& piece : pieces)
        text += piece + L'\0';
    return text + L'\0';
}

TEST(ReplaceEmbeddedNulls, JoinsAFoldersSelectionAndLeavesEverythingElse) {
    ut::test::TempFolder temp;
    const std::wstring folder = temp.MakeFolder(L"clips");
    const std::wstring file = temp.Write(L"clips.avi", "");
    const std::wstring missing = temp.Path(L"missing");
    struct Case {
        std::wstring text;
        wchar_t ch;
        std::wstring expected;
    };
    const Case cases[] = {
        {Selection({folder, L"a.avi", L"b.avi"}), L'|', folder + L"|a.avi|b.avi|" + L'\0'},
        {Selection({folder, L"a.avi"}), L';', folder + L";a.avi;" + L'\0'},
        {Selection({folder}), L'|', folder + L"|" + L'\0'},
        {Selection({folder + L"|x", L"a.avi"}), L'|', Selection({folder + L"|x", L"a.avi"})}, // holds ch
        {Selection({file}), L'|', Selection({file})},                                         // a single file
        {Selection({missing, L"a.avi"}), L'|', Selection({missing, L"a.avi"})},
    };
    for (const Case& c : cases) {
        std::wstring text = c.text;
        KXReplaceEmbededNullCharByChar(text.data(), c.ch);
        EXPECT_EQ(text, c.expected) << ut::platform::Utf8FromWide(c.text.substr(0, c.text.find(L'\0')));
    }
    KXReplaceEmbededNullCharByChar(nullptr, L'|');
}

// A file-dialog service that records the request and answers that the user chose "chosen.avi".
class RecordingDialogs : public ut::test::ComMock<IGWFileDialogs> {
public:
    RecordingDialogs() : ComMock(IID_IGWFileDialogs) {}

    HRESULT STDMETHODCALLTYPE ShowOpenDialog(OPENFILENAMEW* r) override { return Record(L"open", r); }
    HRESULT STDMETHODCALLTYPE ShowSaveDialog(OPENFILENAMEW* r) override { return Record(L"save", r); }
    HRESULT STDMETHODCALLTYPE GetExtendedError(DWORD*) override { return E_NOTIMPL; }

    std::wstring dialog;
    OPENFILENAMEW seen;

private:
    HRESULT Record(const wchar_t* which, OPENFILENAMEW* record) {
        dialog = which;
        std::memcpy(&seen, record, sizeof seen); // with the padding, which the library zeroes
        std::wcscpy(record->lpstrFile, L"chosen.avi");
        return S_OK;
    }
};

TEST(FileDialogs, FillTheRequestForTheirDialogAndAnswerWhetherTheUserChose) {
    const auto owner = reinterpret_cast<HWND>(static_cast<std::uintptr_t>(0x1234));
    wchar_t title[] = L"Pick";
    const wchar_t* filter = L"Clips\0*.avi\0";
    const wchar_t* folder = L"clips";
    wchar_t file[64] = L"start.avi";
    struct Case {
        std::function<int()> select;
        const wchar_t* dialog;
        HWND owner;
        DWORD flags;
    };
    const Case cases[] = {
        {[&] { return KXSelectSaveFileName(title, filter, folder, file, 64); }, L"save", nullptr, 0x280000},
        {[&] { return KXSelectLoadFileName(title, filter, folder, file, 64); }, L"open", nullptr, 0x281200},
        {[&] { return KXSelectLoadFileNameEx(owner, title, filter, folder, file, 64); }, L"open", owner,
         0x281200}};
    for (const Case& c : cases) {
        EXPECT_EQ(c.select(), 0) << "without a dialog service";
        {
            ut::host::ReferenceHost host; // cancels: it has no desktop
            EXPECT_EQ(c.select(), 0);
        }
        RecordingDialogs recorder;
        ut::test::ScopedGenericObject installed(CLSID_GWFileDialogs, &recorder);
        EXPECT_EQ(c.select(), 1);
        EXPECT_STREQ(file, L"chosen.avi");
        EXPECT_EQ(recorder.dialog, c.dialog);
        EXPECT_STREQ(recorder.seen.lpstrDefExt, L"avi");
        OPENFILENAMEW expected;
        std::memset(&expected, 0, sizeof expected);
        expected.lStructSize = sizeof expected;
        expected.hwndOwner = c.owner;
        expected.hInstance = KXDictFindInstance(ut::kDictionaryName); // the library's own module
        expected.lpstrFilter = filter;
        expected.lpstrFile = file;
        expected.nMaxFile = 64;
        expected.lpstrInitialDir = folder;
        expected.lpstrTitle = title;
        expected.Flags = c.flags;
        expected.lpstrDefExt = recorder.seen.lpstrDefExt;
        EXPECT_EQ(std::memcmp(&recorder.seen, &expected, sizeof expected), 0) << "every other field is 0";
        std::wcscpy(file, L"start.avi");
    }
}

} // namespace
