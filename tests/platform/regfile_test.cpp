// ".reg" files on both homes: round trips, every form and encoding, malformed files refused whole.
#include <gtest/gtest.h>

#include <ut/platform/regfile.h>

#include "registry_helpers.h"
#include "support/registry_scratch.h"

namespace {

using namespace ut::test;
using ut::UniqueHKey;
using ut::platform::ExportRegFile;
using ut::platform::ImportRegFile;
using ut::platform::RegFileProblem;

std::wstring DecodeExport(const std::string& bytes) {
    if (bytes.size() < 2 || bytes.compare(0, 2, "\xFF\xFE") != 0)
        return L"<no byte-order mark>";
    return ut::platform::WideFromUtf16Le(reinterpret_cast<const std::uint8_t*>(bytes.data()) + 2,
                                         (bytes.size() - 2) / 2);
}

class RegFile : public testing::Test {
protected:
    void SetUp() override { ASSERT_NE(scratch_.Get(), nullptr); }

    // Imports UTF-8 text; "$" is the scratch key's full path, "HKCU\$" the same with the short root.
    LONG Import(std::string text, RegFileProblem* problem = nullptr) {
        for (std::size_t at; (at = text.find("HKCU\\$")) != std::string::npos;)
            text.replace(at, 6, "HKCU\\" + Narrow(scratch_.SubKey()));
        for (std::size_t at; (at = text.find('$')) != std::string::npos;)
            text.replace(at, 1, Narrow(scratch_.FullPath()));
        return ImportRegFile(text.data(), text.size(), problem);
    }

    ScratchKey scratch_;
};

TEST_F(RegFile, ExportImportsBackUnchanged) {
    const wchar_t* keys[] = {L"export", L"export\\sub key \"q\" \u00c4", L"export\\Stra\u00dfe\\deeper",
                             L"export\\empty"};
    auto filled = [](const wchar_t* path) { return std::wstring(path).find(L"empty") == std::wstring::npos; };
    for (const wchar_t* path : keys) {
        UniqueHKey key = CreateKey(scratch_.Get(), path);
        for (const Sample& sample : EveryKindOfValue())
            EXPECT_TRUE(!filled(path) ||
                        SetValue(key.get(), sample.name, sample.type, sample.data) == ERROR_SUCCESS);
    }
    const std::wstring top = scratch_.FullPath() + L"\\export";
    std::string first, second;
    EXPECT_EQ(ExportRegFile(L"HKEY_NOWHERE\\Software", first), ERROR_BAD_PATHNAME);
    EXPECT_EQ(ExportRegFile((top + L"\\missing").c_str(), first), ERROR_FILE_NOT_FOUND);
    ASSERT_EQ(ExportRegFile(top.c_str(), first), ERROR_SUCCESS);
    std::wstring text = DecodeExport(first);
    EXPECT_EQ(
        text.rfind(L"Windows Registry Editor Version 5.00\r\n\r\n[" + top + L"]\r\n@=\"the default\"\r\n", 0),
        0u);
    for (std::size_t start = 0, end; (end = text.find(L"\r\n", start)) != std::wstring::npos; start = end + 2)
        EXPECT_LE(end - start, 80u) << Narrow(text.substr(start, end - start));

    ASSERT_EQ(RegDeleteTreeW(scratch_.Get(), L"export"), ERROR_SUCCESS);
    RegFileProblem problem;
    ASSERT_EQ(ImportRegFile(first.data(), first.size(), &problem), ERROR_SUCCESS) << Narrow(problem.message);
    ASSERT_EQ(ExportRegFile(top.c_str(), second), ERROR_SUCCESS);
    EXPECT_EQ(DecodeExport(second), text);
    for (const wchar_t* path : keys) {
        UniqueHKey key = OpenKey(scratch_.Get(), path);
        ASSERT_TRUE(key) << Narrow(path);
        for (const Sample& sample : EveryKindOfValue()) {
            Value value = QueryValue(key.get(), sample.name);
            EXPECT_EQ(value.result, filled(path) ? ERROR_SUCCESS : ERROR_FILE_NOT_FOUND);
            EXPECT_EQ(value.data, filled(path) ? sample.data : Bytes()) << Narrow(sample.name);
        }
    }
}

TEST_F(RegFile, ImportReadsEveryForm) {
    struct Case {
        const char* label;
        std::string body; // after the header line; $ is the scratch key
        Value expected;   // of the value "v"
    };
    const Value deleted{ERROR_FILE_NOT_FOUND, REG_NONE, {}};
    // clang-format off
    const Case cases[] = {
        {"quoted text with escapes", "[$]\n\"v\"=\"a\\\\b \\\"c\\\" \\n\"\n", {0, REG_SZ, TextBytes(L"a\\b \"c\" \n")}},
        {"spaces around =", "[$]\n\"v\" = dword:1\n", {0, REG_DWORD, LittleEndian(1, 4)}},
        {"dword", "[$]\n\"v\"=dword:DeadBeef\n", {0, REG_DWORD, LittleEndian(0xDEADBEEF, 4)}},
        {"qword", "[$]\n\"v\"=hex(b):08,07,06,05,04,03,02,01\n", {0, REG_QWORD, LittleEndian(0x0102030405060708, 8)}},
        {"binary over continued lines", "[$]\n\"v\"=hex:01,02,\\\n  03 , 04,\\\n\t05\n", {0, REG_BINARY, Bytes{1, 2, 3, 4, 5}}},
        {"short root and comments", "; a comment\n[HKCU\\$]\n  ; another\n\"v\"=\"x\"\n", {0, REG_SZ, TextBytes(L"x")}},
        {"CR LF lines", "[$]\r\n\"v\"=\"x\"\r\n", {0, REG_SZ, TextBytes(L"x")}},
        {"value deleted after it was set", "[$]\n\"v\"=\"x\"\n\"v\"=-\n", deleted},
        {"deleting what is not there", "[$]\n\"v\"=-\n[-$\\none]\n", deleted},
        {"key deleted after it was made", "[$\\k]\n[-$\\k]\n[$]\n\"v\"=\"x\"\n", {0, REG_SZ, TextBytes(L"x")}},
    };
    // clang-format on
    for (const Case& c : cases) {
        SCOPED_TRACE(c.label);
        RegFileProblem problem;
        ASSERT_EQ(Import("Windows Registry Editor Version 5.00\n\n" + c.body, &problem), ERROR_SUCCESS)
            << Narrow(problem.message) << " line " << problem.line;
        Value value = QueryValue(scratch_.Get(), L"v");
        EXPECT_EQ(std::tie(value.result, value.type, value.data),
                  std::tie(c.expected.result, c.expected.type, c.expected.data));
        EXPECT_FALSE(OpenKey(scratch_.Get(), L"k"));
        ASSERT_EQ(RegDeleteTreeW(scratch_.Get(), nullptr), ERROR_SUCCESS);
    }
}

TEST_F(RegFile, ImportReadsEveryEncoding) {
    const std::wstring text = L"Windows Registry Editor Version 5.00\r\n\r\n[" + scratch_.FullPath() +
                              L"]\r\n\"\u00c4\"=\"\u00e9\U0001F3AC\"\r\n";
    std::string utf16le = "\xFF\xFE", utf16be = "\xFE\xFF";
    ut::platform::AppendUtf16Le(text, utf16le);
    for (std::size_t i = 2; i < utf16le.size(); i += 2)
        utf16be.append({utf16le[i + 1], utf16le[i]});
    const std::pair<const char*, std::string> inputs[] = {
        {"UTF-8", Narrow(text)},
        {"UTF-8 with a byte-order mark", "\xEF\xBB\xBF" + Narrow(text)},
        {"UTF-16LE", utf16le},
        {"UTF-16BE", utf16be},
    };
    for (const auto& [label, bytes] : inputs) {
        ASSERT_EQ(ImportRegFile(bytes.data(), bytes.size(), nullptr), ERROR_SUCCESS) << label;
        EXPECT_EQ(QueryValue(scratch_.Get(), L"\u00e4").data, TextBytes(L"\u00e9\U0001F3AC")) << label;
        ASSERT_EQ(RegDeleteValueW(scratch_.Get(), L"\u00c4"), ERROR_SUCCESS);
    }
}

TEST_F(RegFile, MalformedInputIsRefusedWithItsLineAndNothingApplied) {
    // Each row is line 5, after a key and a value that are valid; the problem is on the line given.
    // clang-format off
    const std::pair<std::string, unsigned> cases[] = {
        {"\"v\"=hex:0g", 5}, {"\"v\"=hex:1,2", 5}, {"\"v\"=hex(zz):00", 5}, {"\"v\"=hex", 5},
        {"\"v\"=dword:123456789", 5}, {"\"v\"=dword:", 5}, {"\"v\"=\"unknown \\q escape\"", 5},
        {"\"v\"=\"not closed", 5}, {"\"v\"=\"x\" trailing", 5}, {"\"v\" \"x\"", 5}, {"\"v\"=str:x", 5},
        {"just words", 5}, {"[HKEY_NOWHERE\\x]", 5}, {"[$\\no bracket", 5}, {"[-HKEY_CURRENT_USER]", 5},
        {"[-$\\gone]\n\"after\"=\"a deletion\"", 6}, {"\"v\"=hex:01,\\", 6}};
    // clang-format on
    for (const auto& [line, expectedLine] : cases) {
        SCOPED_TRACE(line);
        RegFileProblem problem;
        std::string text =
            "Windows Registry Editor Version 5.00\n\n[$\\first]\n\"ok\"=\"yes\"\n" + line + "\n";
        EXPECT_EQ(Import(text, &problem), ERROR_INVALID_DATA);
        EXPECT_EQ(problem.line, expectedLine);
        EXPECT_FALSE(problem.message.empty());
        EXPECT_FALSE(OpenKey(scratch_.Get(), L"first"));
    }
    RegFileProblem problem;
    EXPECT_EQ(Import("REGEDIT4\n\n[$\\first]\n", &problem), ERROR_INVALID_DATA);
    EXPECT_EQ(problem.line, 1u);
    EXPECT_EQ(Import("Windows Registry Editor Version 5.00\n\"v\"=\"before any key\"\n", &problem),
              ERROR_INVALID_DATA);
    EXPECT_EQ(problem.line, 2u);
    EXPECT_EQ(ImportRegFile("\xFF\xFE\x41", 3, &problem), ERROR_INVALID_DATA);
    EXPECT_EQ(problem.line, 0u);
}

} // namespace
