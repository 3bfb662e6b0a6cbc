// ut frames: expand a file-name pattern's '#' padding into frame numbers, or strip it.
#include <cstdio>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include <ut/detail/names.h>
#include <ut/frames.h>
#include <ut/platform/text.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct FramesArguments {
    std::string pattern;
    long first = 0;
    long last = 0;
};

void PrintResult(const wchar_t* result) {
    std::printf("%s\n", platform::Utf8FromWide(result).c_str());
}

CLI::App* AddPatternCommand(CLI::App& frames, const char* name, const char* description, const char* example,
                            FramesArguments& arguments) {
    CLI::App* command = frames.add_subcommand(name, description);
    command->add_option("PATTERN", arguments.pattern, "file name with '#' runs, e.g. shot.###.pic")
        ->required();
    command->footer(std::string("Put -- before the arguments when a pattern or frame starts with '-'.\n"
                                "Example:\n  ") +
                    example);
    return command;
}

} // namespace

void AddFramesCommand(CLI::App& app) {
    CLI::App* frames = app.add_subcommand(
        "frames", "Turn the '#' runs of a file-name pattern into frame numbers, each padded to its run's "
                  "width, or strip them (e.g. ut frames expand shot.###.pic 7 prints shot.007.pic).");
    frames->require_subcommand(1);
    frames->footer("Examples:\n  ut frames expand shot.###.pic 7        shot.007.pic\n"
                   "  ut frames range shot.###.pic 7 12      shot.007_012.pic\n"
                   "  ut frames strip shot.###.pic           shot.pic");
    auto arguments = std::make_shared<FramesArguments>();

    CLI::App* expand =
        AddPatternCommand(*frames, "expand", "Print the pattern with every '#' run replaced by FRAME.",
                          "ut frames expand -- x.###.y -5       prints x.-05.y", *arguments);
    expand->add_option("FRAME", arguments->first, "frame number")->required();
    expand->callback([arguments] {
        wchar_t out[kPathCapacity];
        KXExpandFramePadding(platform::WideFromUtf8(arguments->pattern).c_str(), arguments->first, out);
        PrintResult(out);
    });

    CLI::App* range =
        AddPatternCommand(*frames, "range", "Print the pattern with every '#' run replaced by FIRST_LAST.",
                          "ut frames range a.##.b 7 12        prints a.07_12.b", *arguments);
    range->add_option("FIRST", arguments->first, "first frame of the range")->required();
    range->add_option("LAST", arguments->last, "last frame of the range")->required();
    range->callback([arguments] {
        wchar_t out[kPathCapacity];
        KXExpandFramePadding_Range(platform::WideFromUtf8(arguments->pattern).c_str(), arguments->first,
                                   arguments->last, out);
        PrintResult(out);
    });

    CLI::App* strip = AddPatternCommand(
        *frames, "strip",
        "Print the pattern without its '#' runs; a run after '.' or '\\' takes that character too.",
        "ut frames strip shot.###.pic         prints shot.pic", *arguments);
    strip->callback([arguments] {
        wchar_t out[kPathCapacity];
        KXRemoveFramePadding(platform::WideFromUtf8(arguments->pattern).c_str(), out);
        PrintResult(out);
    });
}

} // namespace ut::tool
