// Runs a command of the ut tool through a CLI11 application as the tool's main does.
#pragma once

#include <string>
#include <vector>

#include <CLI/CLI.hpp>
#include <gtest/gtest.h>

namespace ut::test {

struct Outcome {
    int exit;
    std::string out;
    std::string error = {}; // the one line main() would write on standard error
};

// A usage error exits with 2, a command's own error with its code, each after one line.
inline Outcome RunTool(void (*addCommand)(CLI::App&), const std::vector<std::string>& args) {
    CLI::App app("ut");
    addCommand(app);
    std::vector<const char*> argv = {"ut"};
    for (const std::string& arg : args)
        argv.push_back(arg.c_str());
    testing::internal::CaptureStdout();
    Outcome outcome{0, {}, {}};
    try {
        app.parse(static_cast<int>(argv.size()), argv.data());
    } catch (const CLI::ParseError& error) {
        outcome.exit = error.get_exit_code() == 0 ? 0 : 2;
        outcome.error = error.what();
    } catch (const CLI::Error& error) {
        outcome.exit = error.get_exit_code();
        outcome.error = error.what();
    }
    outcome.out = testing::internal::GetCapturedStdout();
    EXPECT_EQ(outcome.error.find('\n'), std::string::npos) << outcome.error;
    return outcome;
}

} // namespace ut::test
