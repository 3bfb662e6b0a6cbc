// ut: inspect what the library persists and registers, and try its utilities from a shell.
#include <algorithm>
#include <cstdio>
#include <exception>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include <ut/platform/process.h>

#include "commands.h"

namespace {

// Error texts may span lines; the tool's error is always one.
void ReportLine(const std::string& message) {
    std::string line = message;
    for (char& c : line)
        if (c == '\n' || c == '\r')
            c = ' ';
    std::fprintf(stderr, "ut: %s\n", line.c_str());
}

} // namespace

int main(int argc, char** argv) {
    CLI::App app("Try the ut utility library from a shell: frame patterns, name sorting, scene file "
                 "headers, time conversion, the registry, and a tour of the library on its reference host.",
                 "ut");
    app.set_version_flag("--version", "ut " UT_VERSION);
    app.require_subcommand(1);
    // Windows builds would otherwise take a path such as /tmp/scene.mi for an option.
    app.allow_windows_style_options(false);
    app.footer("Examples:\n"
               "  ut frames expand shot.###.pic 7     prints shot.007.pic\n"
               "  ls renders | ut sort                 render9.exr before render10.exr\n"
               "  ut header scene.mi --json            frame range, step, fields and names as JSON\n"
               "  ut time seconds-to-frame 2.5         the frame at 2.5 s in the scene's format\n"
               "  ut registry export HKEY_CURRENT_USER\\Software\\ut out.reg   a branch as a .reg file\n"
               "  ut demo                              a tour of the library\n"
               "Run 'ut COMMAND --help' for the arguments of a command and an example.\n"
               "Exit status: 0 success, 1 the answer is no, 2 bad usage or unreadable input.");
    ut::tool::AddDemoCommand(app);
    ut::tool::AddFramesCommand(app);
    ut::tool::AddSortCommand(app);
    ut::tool::AddHeaderCommand(app);
    ut::tool::AddTimeCommand(app);
    ut::tool::AddRegistryCommand(app);
    ut::tool::AddSceneCommand(app);
    ut::tool::AddStreamCommand(app);
    ut::tool::AddSourcesCommand(app);
    ut::tool::AddStorageCommand(app);
    ut::tool::AddFileCommands(app);
    ut::tool::AddThumbnailCommand(app);
    ut::tool::AddPresetsCommand(app);

    try {
        std::vector<std::string> arguments = ut::platform::Utf8Arguments(argc, argv);
        std::reverse(arguments.begin(), arguments.end()); // CLI11 takes them last first
        app.parse(arguments);
    } catch (const CLI::Success& e) {
        return app.exit(e); // --help and --version
    } catch (const CLI::ParseError& e) {
        ReportLine(e.what());
        return ut::tool::kExitUsage;
    } catch (const ut::tool::Exit& e) {
        if (!e.message.empty())
            ReportLine(e.message);
        return e.status;
    } catch (const std::exception& e) {
        ReportLine(e.what());
        return ut::tool::kExitUsage;
    }
    return ut::tool::kExitSuccess;
}
