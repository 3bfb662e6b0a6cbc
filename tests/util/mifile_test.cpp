#include <cstdlib>
#include <filesystem>
#include <random>
#include <string>

#include <gtest/gtest.h>

#include <ut/mifile.h>
#include <ut/platform/com.h>
#include <ut/platform/text.h>

#include "support/temp_folder.h"

namespace {

// One read of `content` as "<result> <begin> <end> <step> <field> <scene name>|<translator>";
// a name the reader did not touch stays "untouched", a null one is "(null)".
std::string Read(const std::string& content) {
    ut::test::TempFolder folder;
    std::string name = ut::platform::Utf8FromWide(folder.Write(L"scene.mi", content));
    static char untouched[] = "untouched";
    long begin = -99, end = -99, step = -99, field = -99;
    char* scene = untouched;
    char* translator = untouched;
    long result = KXReadMIFileHeader(name.data(), &begin, &end, &step, &field, &scene, &translator);
    std::string words = (result == S_OK     ? "S_OK "
                         : result == E_FAIL ? "E_FAIL "
                                            : "other ") +
                        std::to_string(begin) + " " + std::to_string(end) + " " + std::to_string(step) + " " +
                        std::to_string(field) + " " + (scene ? scene : "(null)") + "|" +
                        (translator ? translator : "(null)");
    for (char* text : {scene, translator})
        if (text != untouched)
            std::free(text);
    return words;
}

std::string Lines(int count, const std::string& line) {
    std::string text;
    for (int i = 0; i < count; ++i)
        text += line + "\n";
    return text;
}

TEST(MIFileHeader, ReadsTheFirstBlockOfSetLinesByItsTokenRules) {
    const std::string none = " untouched|untouched";
    const std::string defaults = " 1 1 1 0" + none;
    const std::string nul(1, '\0');
    struct Case {
        const char* rule;
        std::string content, expected;
    };
    // clang-format off
    const Case cases[] = {
        {"the four integers", "set begin 10\nset end 20\nset step 2\nset field 1\nrender\n", "S_OK 10 20 2 1" + none},
        {"lines after the block are not read", "set begin 10\nrender\nset end 20\n", "S_OK 10 1 1 0" + none},
        {"the block may start late", "# exported\n\nobject\nset end 5\n", "S_OK 1 5 1 0" + none},
        {"space indent counts", "   set begin 3\n  set end 4", "S_OK 3 4 1 0" + none},
        {"tab indent does not", "\tset begin 3\nset end 4\n\tset step 5\n", "S_OK 1 4 1 0" + none},
        {"a word beginning with set counts", "settings begin 6\nsetup end 7\n", "S_OK 6 7 1 0" + none},
        {"keywords are case-sensitive and end at a space", "set BEGIN 5\nset begins 5\nset begin\t5\n", "S_OK" + defaults},
        {"a keyword without a value leaves the default", "set begin\nset end   \nset\n", "S_OK" + defaults},
        {"integers read as atol reads them", "set begin -12abc\nset end abc\nset step +3\nset field \"4\"\n", "S_OK -12 0 3 4" + none},
        {"a later line overwrites", "set begin 1\nset begin 8\n", "S_OK 8 1 1 0" + none},
        {"names after an equals sign", "set scene_name = \"main shot\"\nset translator = \"exporter 2\"\n", "S_OK 1 1 1 0 main shot|exporter 2"},
        {"names after one space are not taken", "set scene_name \"main\"\nset translator \"exp\"\n", "S_OK" + defaults},
        {"names after two spaces are", "set scene_name  \"main\"\nset translator  \"exp\"\n", "S_OK 1 1 1 0 main|exp"},
        {"a name takes the second piece cut at quotes", "set scene_name \"a\" b \"c\"\nset translator x\n", "S_OK 1 1 1 0  b |untouched"},
        {"an unclosed quote still cuts", "set scene_name = \"open\n", "S_OK 1 1 1 0 open|untouched"},
        {"line ends of either kind", "set begin 4\r\nset scene_name = \"crlf\"\r\nset end 6\r\n", "S_OK 4 6 1 0 crlf|untouched"},
        {"a NUL ends the line's text", "set begin 4" + nul + " end 9\nset end 5\n", "S_OK 4 5 1 0" + none},
        {"the set line on line 100", Lines(99, "x") + "set begin 2\n", "S_OK 2 1 1 0" + none},
        {"the set line on line 101", Lines(100, "x") + "set begin 2\n", "E_FAIL" + defaults},
        {"an empty file", "", "E_FAIL" + defaults},
        {"no set line", "render\nend\n", "E_FAIL" + defaults},
        {"a cut-short last line", "set begin 12", "S_OK 12 1 1 0" + none},
        {"a 499-character line still ends normally", "set begin 3 " + std::string(487, 'x') + "\nset end 4\n", "S_OK 3 4 1 0" + none},
        {"a longer line is cut and ends the file", "set begin 3 " + std::string(488, 'x') + "\nset end 4\n", "S_OK 3 1 1 0" + none},
        {"a long line before the block hides it", std::string(600, 'x') + "\nset begin 3\n", "E_FAIL" + defaults},
        {"a 10 MB line", "set begin 9 " + std::string(10 << 20, 'y'), "S_OK 9 1 1 0" + none},
        {"10 MB without a line end", std::string(10 << 20, 'z'), "E_FAIL" + defaults},
    };
    // clang-format on
    for (const Case& c : cases)
        EXPECT_EQ(Read(c.content), c.expected) << c.rule;
}

TEST(MIFileHeader, ChecksTheIntegerOutputsBeforeTheFileAndLeavesAbsentNameOutputsAlone) {
    ut::test::TempFolder folder;
    std::string name = ut::platform::Utf8FromWide(
        folder.Write(L"named.mi", "set scene_name = \"s\"\nset translator = \"t\"\n"));
    long a = 7, b = 7, c = 7, d = 7;
    for (int missing = 0; missing < 4; ++missing) {
        long* p[4] = {&a, &b, &c, &d};
        p[missing] = nullptr;
        EXPECT_EQ(KXReadMIFileHeader(name.data(), p[0], p[1], p[2], p[3], nullptr, nullptr), E_INVALIDARG);
    }
    EXPECT_EQ(a + b + c + d, 28) << "an output was written before the check";
    std::string folderName = ut::platform::Utf8FromWide(folder.Path());
    char missingFile[] = "no such folder/no such file.mi";
    for (char* file : {missingFile, static_cast<char*>(nullptr), folderName.data()})
        EXPECT_EQ(KXReadMIFileHeader(file, &a, &b, &c, &d, nullptr, nullptr), E_FAIL);
    EXPECT_EQ(a, 1) << "defaults are set once the arguments are checked";
    EXPECT_EQ(KXReadMIFileHeader(name.data(), &a, &b, &c, &d, nullptr, nullptr), S_OK);
}

TEST(MIFileHeader, SurvivesBinaryFiles) {
    std::mt19937 random(7);
    for (int round = 0; round < 50; ++round) {
        std::string garbage(4096, '\0');
        for (char& c : garbage)
            c = static_cast<char>(random() % 4 == 0 ? "set \"\n"[random() % 6] : random());
        std::string got = Read(garbage);
        EXPECT_TRUE(got.starts_with("S_OK") || got.starts_with("E_FAIL")) << got;
    }
}

} // namespace
