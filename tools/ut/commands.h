// The subcommands of the ut tool. Each Add<Command>Command puts its subcommand, with its help and
// an example, on the tool's application; main() parses the command line and runs it.
#pragma once

#include <string>

#include <ut/host/reference_scene.h>

namespace CLI {
class App;
}

namespace ut::tool {

// Exit statuses of every command.
inline constexpr int kExitSuccess = 0;
inline constexpr int kExitNo = 1;    // the answer is no: nothing found
inline constexpr int kExitUsage = 2; // bad usage or unreadable input

// Thrown by a command to end the tool with `status`; main() writes `message` as one line on
// standard error.
struct Exit {
    int status;
    std::string message;
};

[[noreturn]] inline void Fail(int status, std::string message) {
    throw Exit{status, std::move(message)};
}

// The scene the scene commands set up when no description is given, and a description read from
// a JSON file (a file that cannot be read or is no description ends the tool with status 2).
ut::host::SceneDescription SampleScene();
ut::host::SceneDescription ReadScene(const std::string& file);

void AddDemoCommand(CLI::App& app);
void AddFramesCommand(CLI::App& app);
void AddSortCommand(CLI::App& app);
void AddHeaderCommand(CLI::App& app);
void AddTimeCommand(CLI::App& app);
void AddSceneCommand(CLI::App& app);
void AddStreamCommand(CLI::App& app);
// ut sources: the sources and clips of a scene.
void AddSourcesCommand(CLI::App& app);
// ut thumbnail put | get.
void AddThumbnailCommand(CLI::App& app);
// ut storage ls | cat.
void AddStorageCommand(CLI::App& app);
// ut validate, ut paths and ut bitmap.
void AddFileCommands(CLI::App& app);
// ut presets find.
void AddPresetsCommand(CLI::App& app);

// ut registry list | get | export | import; list lives in registry_list.cpp.
void AddRegistryCommand(CLI::App& app);
void AddRegistryListCommand(CLI::App& registry);

} // namespace ut::tool
