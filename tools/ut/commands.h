// The subcommands of the ut tool. Each takes the arguments after its name and returns the
// process exit code.
#pragma once

#include <string>
#include <vector>

namespace ut::tool {

using Arguments = std::vector<std::string>;

int Demo(const Arguments& args);

} // namespace ut::tool
