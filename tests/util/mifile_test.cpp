#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>

#include <gtest/gtest.h>

#include <ut/mifile.h>
#include <ut/platform/com.h>

namespace {

// A file with the given content in the temporary folder, removed at the end of the test.
class TempFile {
public:
    explicit TempFile(const std::string& content) {
        static int counter = 0;
        path_ = std::filesystem::temp_directory_path() /
                ("ut_mifile_" + std::to_string(std::rand()) + "_" + std::to_string(++counter) + ".mi");
        std::ofstream(path_, std::ios::binary) << content;
    }
    ~TempFile() {
        std::error_code ignored;
        std::filesystem::remove(path_, ignored);
    }
    std::string Name() const { return path_.string(); }

private:
    std::filesystem::path path_;
};

// What one read gives; a name the reader did not touch stays "untouched".
struct Header {
    long result = 0;
    long begin = -99, end = -99, step = -99, field = -99;
    std::string sceneName, translator;
};

Header Read(const std::string& fileName) {
    static char untouched[] = "untouched";
    Header header;
    char* sceneName = untouched;
    char* translator = untouched;
    std::string name = fileName;
    header.result = KXReadMIFileHeader(name.data(), &header.begin, &header.end, &header.step, &header.field,
                                       &sceneName, &translator);
    header.sceneName = sceneName ? sceneName : "(null)";
    header.translator = translator ? translator : "(null)";
    if (sceneName != untouched)
        std::free(sceneName);
    if (translator != untouched)
        std::free(translator);
    return header;
}

std::string Lines(int count, const std::string& line) {
    std::string text;
    for (int i = 0; i < count; ++i)
        text += line + "\n";
    return text;
}

TEST(MIFileHeader, ReadsTheFirstBlockOfSetLinesByItsTokenRules) {
    struct Case {
        const char* rule;
        std::string content;
        long result, begin, end, step, field;
        const char* sceneName;
        const char* translator;
    };
    const Case cases[] = {
        {"the four integers", "set begin 10\nset end 20\nset step 2\nset field 1\nrender\n", S_OK, 10, 20, 2,
         1, "untouched", "untouched"},
        {"lines after the block are not read", "set begin 10\nrender\nset end 20\n", S_OK, 10, 1, 1, 0,
         "untouched", "untouched"},
        {"the block may start late", "# exported\n\nobject\nset end 5\n", S_OK, 1, 5, 1, 0, "untouched",
         "untouched"},
        {"space indent counts", "   set begin 3\n  set end 4", S_OK, 3, 4, 1, 0, "untouched", "untouched"},
        {"tab indent does not", "\tset begin 3\nset end 4\n\tset step 5\n", S_OK, 1, 4, 1, 0, "untouched",
         "untouched"},
        {"a word beginning with set counts", "settings begin 6\nsetup end 7\n", S_OK, 6, 7, 1, 0, "untouched",
         "untouched"},
        {"keywords are case-sensitive and end at a space", "set BEGIN 5\nset begins 5\nset begin\t5\n", S_OK,
         1, 1, 1, 0, "untouched", "untouched"},
        {"a keyword without a value leaves the default", "set begin\nset end   \nset\n", S_OK, 1, 1, 1, 0,
         "untouched", "untouched"},
        {"integers read as atol reads them", "set begin -12abc\nset end abc\nset step +3\nset field \"4\"\n",
         S_OK, -12, 0, 3, 4, "untouched", "untouched"},
        {"a later line overwrites", "set begin 1\nset begin 8\n", S_OK, 8, 1, 1, 0, "untouched", "untouched"},
        {"names after an equals sign", "set scene_name = \"main shot\"\nset translator = \"exporter 2\"\n",
         S_OK, 1, 1, 1, 0, "main shot", "exporter 2"},
        {"names after one space are not taken", "set scene_name \"main\"\nset translator \"exp\"\n", S_OK, 1,
         1, 1, 0, "untouched", "untouched"},
        {"names after two spaces are", "set scene_name  \"main\"\nset translator  \"exp\"\n", S_OK, 1, 1, 1,
         0, "main", "exp"},
        {"a name takes the second piece cut at quotes", "set scene_name \"a\" b \"c\"\nset translator x\n",
         S_OK, 1, 1, 1, 0, " b ", "untouched"},
        {"an unclosed quote still cuts", "set scene_name = \"open\n", S_OK, 1, 1, 1, 0, "open", "untouched"},
        {"line ends of either kind", "set begin 4\r\nset scene_name = \"crlf\"\r\nset end 6\r\n", S_OK, 4, 6,
         1, 0, "crlf", "untouched"},
        {"a NUL ends the line's text", "set begin 4" + std::string(1, '\0') + " end 9\nset end 5\n", S_OK, 4,
         5, 1, 0, "untouched", "untouched"},
        {"the set line on line 100", Lines(99, "x") + "set begin 2\n", S_OK, 2, 1, 1, 0, "untouched",
         "untouched"},
        {"the set line on line 101", Lines(100, "x") + "set begin 2\n", E_FAIL, 1, 1, 1, 0, "untouched",
         "untouched"},
        {"an empty file", "", E_FAIL, 1, 1, 1, 0, "untouched", "untouched"},
        {"no set line", "render\nend\n", E_FAIL, 1, 1, 1, 0, "untouched", "untouched"},
        {"a cut-short last line", "set begin 12", S_OK, 12, 1, 1, 0, "untouched", "untouched"},
        {"a 499-character line still ends normally", "set begin 3 " + std::string(487, 'x') + "\nset end 4\n",
         S_OK, 3, 4, 1, 0, "untouched", "untouched"},
        {"a longer line is cut and ends the file", "set begin 3 " + std::string(488, 'x') + "\nset end 4\n",
         S_OK, 3, 1, 1, 0, "untouched", "untouched"},
        {"a long line before the block hides it", std::string(600, 'x') + "\nset begin 3\n", E_FAIL, 1, 1, 1,
         0, "untouched", "untouched"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.rule);
        TempFile file(c.content);
        Header got = Read(file.Name());
        EXPECT_EQ(got.result, c.result);
        EXPECT_EQ(got.begin, c.begin);
        EXPECT_EQ(got.end, c.end);
        EXPECT_EQ(got.step, c.step);
        EXPECT_EQ(got.field, c.field);
        EXPECT_EQ(got.sceneName, c.sceneName);
        EXPECT_EQ(got.translator, c.translator);
    }
}

TEST(MIFileHeader, ChecksTheIntegerOutputsBeforeTheFile) {
    TempFile file("set begin 5\n");
    std::string name = file.Name();
    long a = 7, b = 7, c = 7, d = 7;
    long* outputs[] = {&a, &b, &c, &d};
    for (int missing = 0; missing < 4; ++missing) {
        long* p[4] = {outputs[0], outputs[1], outputs[2], outputs[3]};
        p[missing] = nullptr;
        EXPECT_EQ(KXReadMIFileHeader(name.data(), p[0], p[1], p[2], p[3], nullptr, nullptr), E_INVALIDARG);
    }
    EXPECT_EQ(a + b + c + d, 28) << "an output was written before the check";
    char missingFile[] = "no such folder/no such file.mi";
    EXPECT_EQ(KXReadMIFileHeader(missingFile, &a, &b, &c, &d, nullptr, nullptr), E_FAIL);
    EXPECT_EQ(KXReadMIFileHeader(nullptr, &a, &b, &c, &d, nullptr, nullptr), E_FAIL);
    std::string folder = std::filesystem::temp_directory_path().string();
    EXPECT_EQ(KXReadMIFileHeader(folder.data(), &a, &b, &c, &d, nullptr, nullptr), E_FAIL);
    EXPECT_EQ(a, 1) << "defaults are set once the arguments are checked";
}

TEST(MIFileHeader, LeavesAbsentNameOutputsAloneAndSurvivesLargeAndBinaryFiles) {
    long begin = 0, end = 0, step = 0, field = 0;
    TempFile named("set scene_name = \"s\"\nset translator = \"t\"\n");
    std::string name = named.Name();
    EXPECT_EQ(KXReadMIFileHeader(name.data(), &begin, &end, &step, &field, nullptr, nullptr), S_OK);

    TempFile oneLine("set begin 9 " + std::string(10 << 20, 'y'));
    EXPECT_EQ(Read(oneLine.Name()).begin, 9);
    TempFile noNewline(std::string(10 << 20, 'z'));
    EXPECT_EQ(Read(noNewline.Name()).result, E_FAIL);

    std::mt19937 random(7);
    for (int round = 0; round < 50; ++round) {
        std::string garbage(4096, '\0');
        for (char& c : garbage)
            c = static_cast<char>(random() % 4 == 0 ? "set \"\n"[random() % 6] : random());
        TempFile file(garbage);
        Header got = Read(file.Name());
        EXPECT_TRUE(got.result == S_OK || got.result == E_FAIL);
    }
}

} // namespace
