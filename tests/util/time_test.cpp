#include <algorithm>
#include <functional>
#include <limits>
#include <sstream>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/sdk/testing.h>
#include <ut/time.h>

#include "support/fault_plan.h"

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr LONG kIndefinite = std::numeric_limits<LONG>::min();

// A time of the reference host's scene, `frames` frames in.
tagGWTIME SceneTime(const ut::host::Settings& scene, double frames) {
    CGWTime time(scene.timeFormat, 0.0, scene.frameRate);
    return {scene.timeFormat, scene.frameRate, time.toSeconds(frames)};
}

// One word a value: results by name, times as format, rate and seconds.
template <class... Values>
std::string Words(Values... values) {
    std::ostringstream text;
    auto word = [&](auto value) {
        if constexpr (std::is_same_v<decltype(value), HRESULT>)
            text << " " << ut::test::Result(value);
        else if constexpr (std::is_same_v<decltype(value), tagGWTIME>)
            text << " " << value.format << " " << value.rate << " " << value.time;
        else
            text << " " << value;
    };
    (word(values), ...);
    return text.str().substr(1);
}

// Every test leaves the render time undefined, as the library starts.
class TimeTest : public ::testing::Test {
protected:
    void TearDown() override {
        tagGWTIME undefined = CGWTime::Undefined.ToRecord();
        EXPECT_EQ(KXSetCurrentRenderTime(&undefined), S_OK);
    }
};

TEST_F(TimeTest, ConversionsCountInTheFormatsOwnRateExceptForFramesFieldsAndSamples) {
    struct Case {
        tagGWTIMEFORMAT format;
        double managerRate;
        double countingRate;  // what the conversions use
        double reportedTicks; // what KXGetTimeFormat reports
    };
    // The last: a format CGWTime does not name counts at a default time's rate, 1.
    const Case cases[] = {{GWTIMEFORMAT_FILM, 24.0, 24.0, 24.0},
                          {GWTIMEFORMAT_PAL, 48.0, 25.0, 25.0},
                          {GWTIMEFORMAT_NTSC, 30.0, 30 / 1.001, 30 / 1.001},
                          {GWTIMEFORMAT_VIDEO30, 30.0, 30.0, 30.0},
                          {GWTIMEFORMAT_PAL_FIELDS, 50.0, 50.0, 50.0},
                          {GWTIMEFORMAT_NTSC_FIELDS, 1.0, 60 / 1.001, 60 / 1.001},
                          {GWTIMEFORMAT_VIDEO60, 60.0, 60.0, 60.0},
                          {GWTIMEFORMAT_SECONDS, 30.0, 1.0, 1.0},
                          {GWTIMEFORMAT_FRAMES, 48.0, 48.0, 48.0},
                          {GWTIMEFORMAT_FIELDS, 59.94, 59.94, 59.94},
                          {GWTIMEFORMAT_MILLISECONDS, 7.0, 1000.0, 1000.0},
                          {GWTIMEFORMAT_SAMPLES, 48000.0, 48000.0, 48000.0},
                          {static_cast<tagGWTIMEFORMAT>(99), 12.0, 1.0, 12.0}};
    for (const Case& c : cases) {
        ut::host::ReferenceHost host({.timeFormat = c.format, .frameRate = c.managerRate});
        SCOPED_TRACE("format " + std::to_string(c.format));
        tagGWTIMEFORMAT format{};
        double rate = 0.0, ticks = 0.0;
        EXPECT_EQ(KXGetTimeFormat(&format, &rate, &ticks), S_OK);
        EXPECT_EQ(std::pair(format, rate), std::pair(c.format, c.managerRate));
        EXPECT_DOUBLE_EQ(ticks, c.reportedTicks);
        EXPECT_DOUBLE_EQ(KXFramesToSeconds(1.0), 1.0 / c.countingRate);
        EXPECT_DOUBLE_EQ(KXSecondsToFrames(KXFramesToSeconds(1.0)), 1.0);
        EXPECT_DOUBLE_EQ(KXSecondsToFrames(KXFramesToSeconds(-7.25)), -7.25);
    }
}

TEST_F(TimeTest, NearestFrameRoundsDownAfterAnEpsilonOfBias) {
    const double eps = CGWTime::Epsilon;
    // Beyond 32 bits, and NaN, give the 32-bit home's indefinite integer.
    // clang-format off
    const std::pair<double, LONG> cases[] = {
        {24.0 - eps / 2, 24}, {24.0 - 2 * eps, 23}, {23.6, 23}, {24.1, 24}, {0.0, 0}, {-eps / 2, 0}, {-0.5, -1},
        {-24.0, -24}, {1.0e6, 1000000}, {2147483648.0, kIndefinite}, {-1e12, kIndefinite}, {kNaN, kIndefinite}};
    // clang-format on
    ut::host::ReferenceHost host({.timeFormat = GWTIMEFORMAT_FILM, .frameRate = 24.0});
    for (auto [frames, expected] : cases)
        EXPECT_EQ(KXSecondsToNearestFrame(frames / 24.0), expected) << frames << " frames";
}

TEST_F(TimeTest, WithoutAHostTheFormatIsTheFallbackAndTheCurrentTimeADefaultOne) {
    EXPECT_EQ(KXGetTimeFormat(nullptr, nullptr, nullptr), S_FALSE);
    EXPECT_EQ(KXSecondsToNearestFrame(2.5), 2);
    tagGWTIME now = {GWTIMEFORMAT_PAL, 7.0, 7.0};
    EXPECT_EQ(KXGetCurrentTime(&now), S_OK);
    EXPECT_EQ(Words(now), Words(CGWTime().ToRecord()));
    tagGWTIMESPAN span{};
    EXPECT_EQ(KXGetCurrentTimeSpan(&span), REGDB_E_CLASSNOTREG);
    for (HRESULT hr : {KXGetCurrentTime(nullptr), KXGetCurrentTimeSpan(nullptr),
                       KXSetCurrentRenderTime(nullptr), KXGetKeyTime(nullptr)})
        EXPECT_EQ(hr, E_POINTER);
}

TEST_F(TimeTest, AFiniteRenderTimeOverridesThePlayPositionUntilAnUndefinedOneIsStored) {
    const ut::host::Settings scene = {.playFrame = 12.0};
    ut::host::ReferenceHost host(scene);
    // Stored as given: format and rate need not agree.
    const std::pair<tagGWTIME, bool> cases[] = {
        {{GWTIMEFORMAT_PAL, 48.0, 2.5}, true},
        {{static_cast<tagGWTIMEFORMAT>(-3), -1.0, -100.0}, true},
        {{GWTIMEFORMAT_FILM, 24.0, std::numeric_limits<double>::infinity()}, false},
        {CGWTime::Undefined.ToRecord(), false},
    };
    for (auto [stored, overrides] : cases) {
        ASSERT_EQ(KXSetCurrentRenderTime(&stored), S_OK);
        ut::test::FaultPlan plan(1000);
        tagGWTIME now{};
        EXPECT_EQ(KXGetCurrentTime(&now), S_OK);
        EXPECT_EQ(Words(now), Words(overrides ? stored : SceneTime(scene, 12.0)));
        EXPECT_EQ(plan.Calls(), overrides ? 0 : 2) << "host calls for " << Words(stored);
    }
}

// The key time of the current container, read without faults; NaN when it cannot be read.
double KeyTime() {
    double seconds = kNaN;
    return KXGetKeyTime(&seconds) == S_OK ? seconds : kNaN;
}

bool Saw(const ut::test::FaultPlan& plan, const char* operation) {
    return std::find(plan.Seen().begin(), plan.Seen().end(), operation) != plan.Seen().end();
}

TEST_F(TimeTest, TheKeyTimeIsTheContainersKeyFrameInSecondsSetEitherWay) {
    ut::host::ReferenceHost host({.timeFormat = GWTIMEFORMAT_FILM, .frameRate = 24.0, .keyFrame = 12.0});
    EXPECT_EQ(KeyTime(), 0.5);
    for (int refresh : {0, 1}) {
        for (int throughParameter : {0, 1}) {
            ut::test::FaultPlan plan(1000);
            EXPECT_EQ(KXSetKeyTime(1.25, refresh, throughParameter), S_OK);
            EXPECT_TRUE(
                Saw(plan, throughParameter ? "IGWParameter::SetParamValue" : "IGWProperties::SetValue"));
            EXPECT_EQ(Saw(plan, "IGWProperties::Refresh"), refresh != 0);
            EXPECT_EQ(KeyTime(), 1.25);
            ASSERT_EQ(KXSetKeyTime(0.0, 0, 0), S_OK);
        }
    }
}

TEST_F(TimeTest, WithoutACurrentContainerEachCallWorksOnANewOne) {
    ut::host::ReferenceHost host({.keyFrame = 15.0, .currentContainer = false});
    ut::test::LiveObjectCheck live;
    EXPECT_EQ(KXSetKeyTime(3.0, 1, 1), S_OK);
    EXPECT_EQ(KeyTime(), 0.5);   // the new container starts at the host's key frame again
    for (int failing : {2, 3}) { // the creation, the class's factory
        ut::test::FaultPlan plan(failing, E_ACCESSDENIED);
        double seconds = -1.0;
        EXPECT_EQ(KXGetKeyTime(&seconds), E_ACCESSDENIED) << "host call " << failing;
        EXPECT_EQ(seconds, -1.0);
    }
}

TEST_F(TimeTest, EveryHostFailureFallsBackOrIsReturnedAndLeavesNothingBehind) {
    ut::host::ReferenceHost host({.timeFormat = GWTIMEFORMAT_FILM,
                                  .frameRate = 24.0,
                                  .timeDisplay = GWTIMEDISPLAY_TIMECODE,
                                  .playFrame = 6.0,
                                  .firstFrame = 12.0,
                                  .keyFrame = 12.0});
    ASSERT_EQ(KXSetKeyTime(1.0, 0, 0), S_OK); // the current container now differs from a new one
    struct Scenario {
        const char* name;
        std::function<std::string()> run;
        // Row 0: the clean run; row n: host call n failing.
        std::vector<std::string> outcomes;
    };
    // clang-format off
    const Scenario scenarios[] = {
        // The time manager is found, then asked; without it the scene counts seconds at rate 1.
        {"KXGetTimeFormat", [] {
             tagGWTIMEFORMAT format{};
             double rate = 0.0, ticks = 0.0;
             HRESULT hr = KXGetTimeFormat(&format, &rate, &ticks);
             return Words(hr, format, rate, ticks); },
         {"S_OK 1 24 24", "S_FALSE 10 1 1", "S_FALSE 10 1 1"}},
        // The display format is left as the failed query left it.
        {"KXGetDisplayTimeFormat", [] {
             auto display = static_cast<GWTIMEDISPLAYFORMAT>(77);
             tagGWTIMEFORMAT format{};
             HRESULT hr = KXGetDisplayTimeFormat(&display, &format, nullptr, nullptr);
             return Words(hr, display, format); },
         {"S_OK 1 1", "S_FALSE 77 10", "S_FALSE 77 10"}},
        {"KXFramesToSeconds", [] { return Words(KXFramesToSeconds(48.0)); }, {"2", "48", "48"}},
        // The play position, else the start of the play range, else a default time.
        {"KXGetCurrentTime", [] {
             tagGWTIME now = {GWTIMEFORMAT_PAL, 7.0, 7.0};
             HRESULT hr = KXGetCurrentTime(&now);
             return Words(hr, now); },
         {"S_OK 1 24 0.25", "S_OK 10 1 0", "S_OK 1 24 0.5", "S_OK 10 1 0"}},
        {"KXGetCurrentTimeSpan", [] {
             tagGWTIMESPAN span{};
             HRESULT hr = KXGetCurrentTimeSpan(&span);
             return Words(hr, span.start.time); },
         {"S_OK 0.5", "E_FAIL 0", "E_FAIL 0"}},
        // Current container (else a new one: creation, factory), key-time property (else the current
        // time: play control, its position), its value, then the conversion's time manager and format.
        {"KXGetKeyTime", [] { double seconds = -1.0; HRESULT hr = KXGetKeyTime(&seconds); return Words(hr, seconds); },
         {"S_OK 1", "S_OK 0.5", "S_OK 0.25", "E_FAIL -1", "S_OK 24", "S_OK 24"}},
        // Current container, key-time property, time manager, format, the parameter's setter, the
        // refresh; then the key time afterwards.
        {"KXSetKeyTime", [] {
             HRESULT hr = KXSetKeyTime(2.0, 1, 1);
             ut::sdk::SetHostFaultHook(nullptr); // lifts the fault to read the key time back
             std::string outcome = Words(hr, KeyTime());
             EXPECT_EQ(KXSetKeyTime(1.0, 0, 0), S_OK);
             return outcome; },
         {"S_OK 2", "S_OK 1", "E_FAIL 1", "S_OK 0.0833333", "S_OK 0.0833333", "E_FAIL 1", "E_FAIL 2"}},
    };
    // clang-format on
    for (const Scenario& scenario : scenarios) {
        ut::test::WalkHostFaults(scenario.run, [&](int row, const std::string& outcome) {
            ASSERT_LT(row, static_cast<int>(scenario.outcomes.size()))
                << scenario.name << " makes more host calls";
            EXPECT_EQ(outcome, scenario.outcomes[row]) << scenario.name << ", row " << row;
        });
    }
}

} // namespace
