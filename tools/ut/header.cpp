// ut header: the header block of an exported scene description file.
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <ut/mifile.h>
#include <ut/platform/input_file.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct HeaderArguments {
    std::string file;
    bool json = false;
};

// A text the reader allocated with malloc, freed with it.
struct FreeText {
    void operator()(char* text) const noexcept { std::free(text); }
};
using Text = std::unique_ptr<char, FreeText>;

struct Header {
    long begin = 0;
    long end = 0;
    long step = 0;
    long field = 0;
    Text sceneName;
    Text translator;
};

Header Read(const std::string& file) {
    // The reader answers E_FAIL both for a file it cannot open and one without a header; only the
    // first is an error of the input.
    if (!platform::InputFilePtr(platform::OpenInputFile(file.c_str())))
        Fail(kExitUsage, "cannot open " + file);
    Header header;
    char* sceneName = nullptr;
    char* translator = nullptr;
    long result = KXReadMIFileHeader(const_cast<char*>(file.c_str()), &header.begin, &header.end,
                                     &header.step, &header.field, &sceneName, &translator);
    header.sceneName.reset(sceneName);
    header.translator.reset(translator);
    if (result < 0)
        Fail(kExitNo, file + ": no line of the first 100 begins with \"set\"");
    return header;
}

void PrintText(const Header& header) {
    std::printf("begin %ld\nend %ld\nstep %ld\nfield %ld\n", header.begin, header.end, header.step,
                header.field);
    std::printf("scene_name%s%s\n", header.sceneName ? " " : "",
                header.sceneName ? header.sceneName.get() : "");
    std::printf("translator%s%s\n", header.translator ? " " : "",
                header.translator ? header.translator.get() : "");
}

nlohmann::ordered_json TextOrNull(const Text& text) {
    return text ? nlohmann::ordered_json(text.get()) : nlohmann::ordered_json(nullptr);
}

void PrintJson(const Header& header) {
    nlohmann::ordered_json out = {{"begin", header.begin},
                                  {"end", header.end},
                                  {"step", header.step},
                                  {"field", header.field},
                                  {"scene_name", TextOrNull(header.sceneName)},
                                  {"translator", TextOrNull(header.translator)}};
    // Names are the file's own bytes: what is not UTF-8 becomes U+FFFD.
    std::printf("%s\n", out.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace).c_str());
}

} // namespace

void AddHeaderCommand(CLI::App& app) {
    CLI::App* header = app.add_subcommand(
        "header", "Read the header block of an exported scene description file: frame range, step, field "
                  "setting, scene name and translator.");
    auto arguments = std::make_shared<HeaderArguments>();
    header->add_option("FILE", arguments->file, "the scene description file")->required();
    header->add_flag("--json", arguments->json, "print one JSON object instead of one line per value");
    header->footer(
        "Prints begin, end, step, field, scene_name and translator, one per line (a name that is "
        "absent leaves its line bare). Exit status 1 when no line of the first 100 begins with "
        "\"set\".\nExample:\n  ut header scene.mi --json\n  "
        "{\"begin\":1,\"end\":100,\"step\":1,\"field\":0,\"scene_name\":\"shot\",\"translator\":null}");
    header->callback([arguments] {
        Header read = Read(arguments->file);
        if (arguments->json)
            PrintJson(read);
        else
            PrintText(read);
    });
}

} // namespace ut::tool
