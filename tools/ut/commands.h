// The subcommands of the ut tool. Each takes the arguments after its name and returns the
// process exit code; the ones written for CLI11 add themselves to the tool's parser instead.
#pragma once

#include <string>
#include <vector>

namespace CLI {
class App;
}

namespace ut::tool {

using Arguments = std::vector<std::string>;

int Demo(const Arguments& args);

// ut registry get | export | import.
void AddRegistryCommand(CLI::App& app);

} // namespace ut::tool
