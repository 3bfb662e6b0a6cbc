// ut time: frames and seconds under a scene's time format, on the reference host.
//
//   ut time frames-to-seconds 1 24 48            seconds of each frame count at 30 frames a second
//   ut time seconds-to-frame 0.5 --fps 24        the frame each time falls in, at 24 frames a second
//   ut time frames-to-seconds 25 --format pal    in another format (a name or its number)
#include <charconv>
#include <cstdio>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include <ut/host/reference_host.h>
#include <ut/time.h>

#include "commands.h"

namespace ut::tool {
namespace {

const std::map<std::string, int> kFormatNames = {
    {"film", GWTIMEFORMAT_FILM},
    {"pal", GWTIMEFORMAT_PAL},
    {"ntsc", GWTIMEFORMAT_NTSC},
    {"video30", GWTIMEFORMAT_VIDEO30},
    {"pal-fields", GWTIMEFORMAT_PAL_FIELDS},
    {"ntsc-fields", GWTIMEFORMAT_NTSC_FIELDS},
    {"video60", GWTIMEFORMAT_VIDEO60},
    {"seconds", GWTIMEFORMAT_SECONDS},
    {"frames", GWTIMEFORMAT_FRAMES},
    {"fields", GWTIMEFORMAT_FIELDS},
    {"milliseconds", GWTIMEFORMAT_MILLISECONDS},
    {"samples", GWTIMEFORMAT_SAMPLES},
};

struct TimeOptions {
    std::vector<double> values;
    double fps = 0.0;
    int format = 0;
};

// The scene the options describe: the reference host's default, another rate (counted in frames
// unless a format is given), or another format at its own rate.
ut::host::Settings SceneOf(const TimeOptions& options) {
    ut::host::Settings settings;
    if (options.format != 0) {
        settings.timeFormat = static_cast<tagGWTIMEFORMAT>(options.format);
        settings.frameRate = CGWTime(settings.timeFormat, 0.0, settings.frameRate).GetTicksPerSecond();
    } else if (options.fps > 0.0) {
        settings.timeFormat = GWTIMEFORMAT_FRAMES;
    }
    if (options.fps > 0.0)
        settings.frameRate = options.fps;
    return settings;
}

// The shortest text that reads back as the same double.
std::string Shortest(double value) {
    char text[32];
    auto [end, error] = std::to_chars(text, text + sizeof text, value);
    return error == std::errc() ? std::string(text, end) : std::to_string(value);
}

template <class Convert>
void PrintEach(const TimeOptions& options, Convert convert) {
    ut::host::ReferenceHost host(SceneOf(options));
    if (FAILED(host.Status()))
        throw CLI::RuntimeError("ut time: the reference host did not start", 1);
    for (double value : options.values)
        std::printf("%s\n", convert(value).c_str());
}

CLI::App* AddConversion(CLI::App& time, const char* name, const char* summary, const char* values,
                        const std::shared_ptr<TimeOptions>& options) {
    CLI::App* command = time.add_subcommand(name, summary);
    command->add_option(values, options->values)->required();
    command->add_option("--fps", options->fps, "count at this many frames a second")
        ->check(CLI::PositiveNumber);
    command->add_option("--format", options->format, "count in this format, by name or number")
        ->transform(CLI::CheckedTransformer(kFormatNames, CLI::ignore_case));
    return command;
}

} // namespace

void AddTimeCommand(CLI::App& app) {
    CLI::App* time =
        app.add_subcommand("time", "convert between frames and seconds under a scene's time format");
    time->require_subcommand(1);
    auto options = std::make_shared<TimeOptions>();
    AddConversion(*time, "frames-to-seconds", "the seconds of each frame count", "frames", options)
        ->callback([options] {
            PrintEach(*options, [](double frames) { return Shortest(KXFramesToSeconds(frames)); });
        });
    AddConversion(*time, "seconds-to-frame", "the frame each time in seconds falls in", "seconds", options)
        ->callback([options] {
            PrintEach(*options,
                      [](double seconds) { return std::to_string(KXSecondsToNearestFrame(seconds)); });
        });
}

} // namespace ut::tool
