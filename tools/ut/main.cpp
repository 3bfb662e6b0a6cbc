// ut: inspect what the library persists and registers, and try its utilities from a shell.
#include <cstdio>
#include <cstring>
#include <string>

#include "commands.h"

namespace {

struct Command {
    const char* name;
    int (*run)(const ut::tool::Arguments&);
    const char* summary;
};

const Command kCommands[] = {
    {"demo", &ut::tool::Demo, "load the library on the reference host and show what it does"},
};

int Usage(std::FILE* out) {
    std::fprintf(out, "usage: ut <command> [arguments]\n\ncommands:\n");
    for (const Command& command : kCommands)
        std::fprintf(out, "  %-10s %s\n", command.name, command.summary);
    return out == stdout ? 0 : 2;
}

} // namespace

int main(int argc, char** argv) {
    if (argc < 2)
        return Usage(stderr);
    if (!std::strcmp(argv[1], "help") || !std::strcmp(argv[1], "--help") || !std::strcmp(argv[1], "-h"))
        return Usage(stdout);
    for (const Command& command : kCommands) {
        if (std::strcmp(argv[1], command.name) == 0)
            return command.run(ut::tool::Arguments(argv + 2, argv + argc));
    }
    std::fprintf(stderr, "ut: unknown command '%s'\n\n", argv[1]);
    return Usage(stderr);
}
