// ut sort: sort lines of UTF-8 as the numeric-aware name comparison orders them.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <CLI/CLI.hpp>

#include <ut/compare.h>
#include <ut/platform/text.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct SortArguments {
    bool unique = false;
    bool reverse = false;
};

std::string ReadAll(std::FILE* in) {
    std::string text;
    constexpr std::size_t kChunk = 1 << 20;
    for (;;) {
        std::size_t used = text.size();
        text.resize(used + kChunk);
        std::size_t got = std::fread(text.data() + used, 1, kChunk, in);
        text.resize(used + got);
        if (got < kChunk)
            break;
    }
    if (std::ferror(in))
        Fail(kExitUsage, "cannot read standard input");
    return text;
}

// One input line: its bytes as they came, and its wide form as it compares.
struct Line {
    const wchar_t* key;
    std::string_view bytes;
};

// Splits the input into lines and their keys. The wide text is converted once, as a whole; a
// line end is never part of a UTF-8 sequence, so its lines are the input's. Keys end where the
// line does, without a carriage return before the line end.
std::vector<Line> SplitLines(std::string_view input, std::wstring& wide) {
    wide = platform::WideFromUtf8(input);
    std::vector<Line> lines;
    lines.reserve(static_cast<std::size_t>(std::count(input.begin(), input.end(), '\n')) + 1);
    std::size_t byteStart = 0;
    std::size_t wideStart = 0;
    while (byteStart < input.size()) {
        std::size_t byteEnd = std::min(input.find('\n', byteStart), input.size());
        std::size_t wideEnd = std::min(wide.find(L'\n', wideStart), wide.size());
        if (wideEnd > wideStart && wide[wideEnd - 1] == L'\r')
            wide[wideEnd - 1] = L'\0';
        if (wideEnd < wide.size())
            wide[wideEnd] = L'\0';
        lines.push_back({wide.c_str() + wideStart, input.substr(byteStart, byteEnd - byteStart)});
        byteStart = byteEnd + 1;
        wideStart = wideEnd + 1;
    }
    return lines;
}

void Sort(const SortArguments& arguments) {
    std::string input = ReadAll(stdin);
    std::wstring wide;
    std::vector<Line> lines = SplitLines(input, wide);
    // Stable, so that lines which compare equal keep their input order either way round.
    if (arguments.reverse)
        std::stable_sort(lines.begin(), lines.end(),
                         [](const Line& a, const Line& b) { return F3Dwcsicmpnum(b.key, a.key) < 0; });
    else
        std::stable_sort(lines.begin(), lines.end(),
                         [](const Line& a, const Line& b) { return F3Dwcsicmpnum(a.key, b.key) < 0; });
    std::string out;
    out.reserve(input.size() + 1);
    const Line* kept = nullptr;
    for (const Line& line : lines) {
        if (arguments.unique && kept && F3Dwcsicmpnum(kept->key, line.key) == 0)
            continue;
        kept = &line;
        out.append(line.bytes);
        out.push_back('\n');
    }
    if (std::fwrite(out.data(), 1, out.size(), stdout) != out.size() || std::fflush(stdout) != 0)
        Fail(kExitUsage, "cannot write standard output");
}

} // namespace

void AddSortCommand(CLI::App& app) {
    CLI::App* sort = app.add_subcommand(
        "sort", "Sort lines of UTF-8 from standard input so that trailing numbers compare by value and case "
                "is ignored: clip9 before clip10, x007 before x7.");
    auto arguments = std::make_shared<SortArguments>();
    sort->add_flag("-u,--unique", arguments->unique,
                   "keep only the first line of each group that compares equal");
    sort->add_flag("-r,--reverse", arguments->reverse, "reverse the order");
    sort->footer("Lines that compare equal keep their input order.\nExample:\n"
                 "  printf 'clip10\\nClip9\\nclip9\\n' | ut sort -u     prints Clip9, clip10");
    sort->callback([arguments] { Sort(*arguments); });
}

} // namespace ut::tool
