// The subcommands of the ut tool. Each takes the arguments after its name and returns the
// process exit code.
#pragma once

#include <string>
#include <vector>

namespace CLI {
class App;
}

namespace ut::tool {

using Arguments = std::vector<std::string>;

int Demo(const Arguments& args);

// ut time frames-to-seconds | seconds-to-frame (tools/ut/time.cpp, written for CLI11).
void AddTimeCommand(CLI::App& app);
// ut scene show [FILE.json] [--json] (tools/ut/scene.cpp, written for CLI11).
void AddSceneCommand(CLI::App& app);

} // namespace ut::tool
