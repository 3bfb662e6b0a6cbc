#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "commands.h"
#include "run_tool.h"

namespace {

using ut::test::Outcome;

Outcome RunTool(std::vector<std::string> args) {
    return ut::test::RunTool(&ut::tool::AddTimeCommand, args);
}

TEST(TimeCommand, ConvertsUnderTheScenesFormatOrTheOneAskedFor) {
    struct Case {
        std::vector<std::string> args;
        Outcome expected;
    };
    const Case cases[] = {
        {{"time", "frames-to-seconds", "15", "30", "-3"}, {0, "0.5\n1\n-0.1\n"}},
        {{"time", "frames-to-seconds", "1", "--fps", "24"}, {0, "0.041666666666666664\n"}},
        {{"time", "frames-to-seconds", "50", "--format", "pal"}, {0, "2\n"}},
        {{"time", "frames-to-seconds", "50", "--format", "PAL"}, {0, "2\n"}},
        {{"time", "frames-to-seconds", "50", "--format", "2"}, {0, "2\n"}},
        {{"time", "frames-to-seconds", "3", "--format", "samples", "--fps", "48000"}, {0, "6.25e-05\n"}},
        {{"time", "seconds-to-frame", "0.5", "0.51", "-0.01"}, {0, "15\n15\n-1\n"}},
        {{"time", "seconds-to-frame", "1", "--fps", "24", "--format", "pal"}, {0, "25\n"}},
        {{"time", "seconds-to-frame", "2.5", "--format", "seconds"}, {0, "2\n"}},
        // Bad usage.
        {{"time"}, {2, ""}},
        {{"time", "frames-to-seconds"}, {2, ""}},
        {{"time", "frames-to-seconds", "ten"}, {2, ""}},
        {{"time", "frames-to-seconds", "1", "--fps", "0"}, {2, ""}},
        {{"time", "frames-to-seconds", "1", "--format", "cinema"}, {2, ""}},
        {{"time", "frames-to-seconds", "1", "--format", "99"}, {2, ""}},
        {{"time", "seconds-to-frames", "1"}, {2, ""}},
    };
    for (const Case& c : cases) {
        Outcome run = RunTool(c.args);
        std::string line;
        for (const std::string& arg : c.args)
            line += arg + " ";
        EXPECT_EQ(run.exit, c.expected.exit) << line;
        EXPECT_EQ(run.out, c.expected.out) << line;
    }
}

} // namespace
