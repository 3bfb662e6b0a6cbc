#include <algorithm>
#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/time.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// Seconds of `frames` frames of the reference host's scene.
double SecondsOf(const ut::host::Settings& scene, double frames) {
    return CGWTime(scene.timeFormat, 0.0, scene.frameRate).toSeconds(frames);
}

bool SameTime(const tagGWTIME& a, const tagGWTIME& b) {
    return a.format == b.format && a.rate == b.rate &&
           (a.time == b.time || (std::isnan(a.time) && std::isnan(b.time)));
}

std::string Describe(const tagGWTIME& t) {
    return "{" + std::to_string(t.format) + ", " + std::to_string(t.rate) + ", " + std::to_string(t.time) +
           "}";
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
    const Case cases[] = {
        {GWTIMEFORMAT_FILM, 24.0, 24.0, 24.0},
        {GWTIMEFORMAT_PAL, 48.0, 25.0, 25.0}, // the manager's rate is ignored
        {GWTIMEFORMAT_NTSC, 30.0, 30000.0 / 1001.0, 30000.0 / 1001.0},
        {GWTIMEFORMAT_VIDEO30, 30.0, 30.0, 30.0},
        {GWTIMEFORMAT_PAL_FIELDS, 50.0, 50.0, 50.0},
        {GWTIMEFORMAT_NTSC_FIELDS, 1.0, 60000.0 / 1001.0, 60000.0 / 1001.0},
        {GWTIMEFORMAT_VIDEO60, 60.0, 60.0, 60.0},
        {GWTIMEFORMAT_SECONDS, 30.0, 1.0, 1.0},
        {GWTIMEFORMAT_FRAMES, 48.0, 48.0, 48.0},
        {GWTIMEFORMAT_FIELDS, 59.94, 59.94, 59.94},
        {GWTIMEFORMAT_MILLISECONDS, 7.0, 1000.0, 1000.0},
        {GWTIMEFORMAT_SAMPLES, 48000.0, 48000.0, 48000.0},
        // A format CGWTime does not name: counted at a default object's rate, reported at the manager's.
        {static_cast<tagGWTIMEFORMAT>(99), 12.0, 1.0, 12.0},
    };
    for (const Case& c : cases) {
        ut::host::ReferenceHost host({.timeFormat = c.format, .frameRate = c.managerRate});
        SCOPED_TRACE("format " + std::to_string(c.format));
        tagGWTIMEFORMAT format{};
        double rate = 0.0;
        double ticks = 0.0;
        EXPECT_EQ(KXGetTimeFormat(&format, &rate, &ticks), S_OK);
        EXPECT_EQ(format, c.format);
        EXPECT_EQ(rate, c.managerRate);
        EXPECT_DOUBLE_EQ(ticks, c.reportedTicks);
        double second = KXFramesToSeconds(1.0);
        EXPECT_DOUBLE_EQ(second, 1.0 / c.countingRate);
        EXPECT_DOUBLE_EQ(KXSecondsToFrames(second), 1.0);
        EXPECT_DOUBLE_EQ(KXSecondsToFrames(KXFramesToSeconds(-7.25)), -7.25);
    }
}

TEST_F(TimeTest, NearestFrameRoundsDownAfterAnEpsilonOfBias) {
    struct Case {
        double frames;
        LONG expected;
    };
    const double eps = CGWTime::Epsilon;
    const Case cases[] = {
        {24.0 - eps / 2, 24},
        {24.0 - 2 * eps, 23},
        {23.6, 23},
        {24.1, 24},
        {0.0, 0},
        {-eps / 2, 0},
        {-0.5, -1},
        {-24.0, -24},
        {1.0e6, 1000000},
        {2147483648.0, std::numeric_limits<LONG>::min()}, // beyond 32 bits: the indefinite integer
        {-1e12, std::numeric_limits<LONG>::min()},
        {kNaN, std::numeric_limits<LONG>::min()},
    };
    ut::host::ReferenceHost host({.timeFormat = GWTIMEFORMAT_FILM, .frameRate = 24.0});
    for (const Case& c : cases)
        EXPECT_EQ(KXSecondsToNearestFrame(c.frames / 24.0), c.expected) << c.frames << " frames";
}

TEST_F(TimeTest, AFailingTimeManagerGivesSecondsAtRateOne) {
    ut::host::ReferenceHost host(
        {.timeFormat = GWTIMEFORMAT_PAL, .frameRate = 25.0, .timeDisplay = GWTIMEDISPLAY_TIMECODE});
    // The manager is found, then asked: failing either falls back.
    for (int n = 1;; ++n) {
        ut::test::FaultPlan plan(n);
        tagGWTIMEFORMAT format{};
        double rate = 0.0, ticks = 0.0;
        HRESULT hr = KXGetTimeFormat(&format, &rate, &ticks);
        if (!plan.Fired()) {
            EXPECT_EQ(n, 3);
            EXPECT_EQ(hr, S_OK);
            break;
        }
        EXPECT_EQ(hr, S_FALSE) << "host call " << n;
        EXPECT_EQ(format, GWTIMEFORMAT_SECONDS);
        EXPECT_EQ(rate, 1.0);
        EXPECT_EQ(ticks, 1.0);
    }
    for (int n = 1;; ++n) {
        ut::test::FaultPlan plan(n);
        auto display = static_cast<GWTIMEDISPLAYFORMAT>(77); // whatever the failed query leaves
        tagGWTIMEFORMAT format{};
        HRESULT hr = KXGetDisplayTimeFormat(&display, &format, nullptr, nullptr);
        if (!plan.Fired()) {
            EXPECT_EQ(display, GWTIMEDISPLAY_TIMECODE);
            EXPECT_EQ(format, GWTIMEFORMAT_PAL);
            break;
        }
        EXPECT_EQ(hr, S_FALSE) << "host call " << n;
        EXPECT_EQ(display, 77);
        EXPECT_EQ(format, GWTIMEFORMAT_SECONDS);
    }
    for (int n = 1;; ++n) {
        ut::test::FaultPlan plan(n);
        double seconds = KXFramesToSeconds(50.0);
        if (!plan.Fired()) {
            EXPECT_EQ(seconds, 2.0);
            break;
        }
        EXPECT_EQ(seconds, 50.0) << "host call " << n; // one frame a second
    }
}

TEST_F(TimeTest, WithoutAHostTheFormatIsTheFallbackAndTheCurrentTimeADefaultOne) {
    EXPECT_EQ(KXGetTimeFormat(nullptr, nullptr, nullptr), S_FALSE);
    EXPECT_EQ(KXSecondsToNearestFrame(2.5), 2);
    tagGWTIME now = {GWTIMEFORMAT_PAL, 7.0, 7.0};
    EXPECT_EQ(KXGetCurrentTime(&now), S_OK);
    EXPECT_TRUE(SameTime(now, CGWTime().ToRecord())) << Describe(now);
    tagGWTIMESPAN span{};
    EXPECT_EQ(KXGetCurrentTimeSpan(&span), REGDB_E_CLASSNOTREG);
    EXPECT_EQ(KXGetCurrentTime(nullptr), E_POINTER);
    EXPECT_EQ(KXGetCurrentTimeSpan(nullptr), E_POINTER);
    EXPECT_EQ(KXSetCurrentRenderTime(nullptr), E_POINTER);
    EXPECT_EQ(KXGetKeyTime(nullptr), E_POINTER);
}

TEST_F(TimeTest, AFiniteRenderTimeOverridesThePlayPositionUntilAnUndefinedOneIsStored) {
    const ut::host::Settings scene = {.playFrame = 12.0};
    ut::host::ReferenceHost host(scene);
    const tagGWTIME position = {scene.timeFormat, scene.frameRate, SecondsOf(scene, 12.0)};
    struct Case {
        tagGWTIME stored;
        bool overrides;
    };
    const Case cases[] = {
        {{GWTIMEFORMAT_PAL, 48.0, 2.5}, true}, // stored as it is: format and rate need not agree
        {{static_cast<tagGWTIMEFORMAT>(-3), -1.0, -100.0}, true},
        {{GWTIMEFORMAT_FILM, 24.0, std::numeric_limits<double>::infinity()}, false},
        {CGWTime::Undefined.ToRecord(), false},
    };
    for (const Case& c : cases) {
        ASSERT_EQ(KXSetCurrentRenderTime(const_cast<tagGWTIME*>(&c.stored)), S_OK);
        ut::test::FaultPlan plan(1000);
        tagGWTIME now{};
        EXPECT_EQ(KXGetCurrentTime(&now), S_OK);
        EXPECT_TRUE(SameTime(now, c.overrides ? c.stored : position)) << Describe(now);
        EXPECT_EQ(plan.Calls(), c.overrides ? 0 : 2) << "host calls for " << Describe(c.stored);
    }
}

TEST_F(TimeTest, TheCurrentTimeFallsBackFromThePositionToTheRangeStartToZero) {
    const ut::host::Settings scene = {
        .timeFormat = GWTIMEFORMAT_FILM, .frameRate = 24.0, .playFrame = 36.0, .firstFrame = 12.0};
    ut::host::ReferenceHost host(scene);
    const tagGWTIME expected[] = {
        {scene.timeFormat, scene.frameRate, SecondsOf(scene, 36.0)}, // clean
        CGWTime().ToRecord(),                                        // no play control
        {scene.timeFormat, scene.frameRate, SecondsOf(scene, 12.0)}, // position unreadable
        CGWTime().ToRecord(),                                        // range unreadable too
    };
    for (int n = 1;; ++n) {
        ut::test::LiveObjectCheck live;
        ut::test::FaultPlan plan(n);
        tagGWTIME now = {GWTIMEFORMAT_PAL, 7.0, 7.0};
        EXPECT_EQ(KXGetCurrentTime(&now), S_OK);
        int row = plan.Fired() ? n : 0;
        ASSERT_LT(row, 4);
        EXPECT_TRUE(SameTime(now, expected[row])) << "host call " << n << " failing: " << Describe(now);
        if (!plan.Fired())
            break;
    }
    for (int n = 1;; ++n) {
        ut::test::FaultPlan plan(n, E_ACCESSDENIED);
        tagGWTIMESPAN span{};
        HRESULT hr = KXGetCurrentTimeSpan(&span);
        if (!plan.Fired()) {
            EXPECT_EQ(span.start.time, 0.5);
            EXPECT_DOUBLE_EQ(span.end.time, 100.0 / 24.0);
            break;
        }
        EXPECT_EQ(hr, E_ACCESSDENIED) << "host call " << n;
    }
}

// The key time of the current container, read without faults; NaN when it cannot be read.
double KeyTime() {
    double seconds = kNaN;
    return KXGetKeyTime(&seconds) == S_OK ? seconds : kNaN;
}

TEST_F(TimeTest, TheKeyTimeIsTheContainersKeyFrameInSeconds) {
    struct Case {
        int refresh;
        int throughParameter;
        const char* setter;
    };
    const Case cases[] = {{0, 0, "IGWProperty::SetValue"},
                          {1, 0, "IGWProperty::SetValue"},
                          {0, 1, "IGWParameter::SetParamValue"},
                          {1, 1, "IGWParameter::SetParamValue"}};
    ut::host::ReferenceHost host({.timeFormat = GWTIMEFORMAT_FILM, .frameRate = 24.0, .keyFrame = 12.0});
    EXPECT_EQ(KeyTime(), 0.5);
    for (const Case& c : cases) {
        ut::test::FaultPlan plan(1000);
        EXPECT_EQ(KXSetKeyTime(1.25, c.refresh, c.throughParameter), S_OK);
        const std::vector<std::string>& seen = plan.Seen();
        EXPECT_NE(std::find(seen.begin(), seen.end(), c.setter), seen.end()) << c.setter;
        EXPECT_EQ(std::find(seen.begin(), seen.end(), "IGWProperty::Refresh") != seen.end(), c.refresh != 0);
        EXPECT_EQ(KeyTime(), 1.25);
        ASSERT_EQ(KXSetKeyTime(0.0, 0, 0), S_OK);
    }
}

TEST_F(TimeTest, WithoutACurrentContainerEachCallWorksOnANewOne) {
    ut::host::ReferenceHost host({.keyFrame = 15.0, .currentContainer = false});
    ut::test::LiveObjectCheck live;
    EXPECT_EQ(KXSetKeyTime(3.0, 1, 1), S_OK);
    EXPECT_EQ(KeyTime(), 0.5); // the new container starts at the host's key frame again
}

TEST_F(TimeTest, KeyTimeFaultsFallBackOrAreReturnedAndLeaveNothingBehind) {
    const ut::host::Settings scene = {
        .timeFormat = GWTIMEFORMAT_FILM, .frameRate = 24.0, .playFrame = 6.0, .keyFrame = 12.0};
    ut::host::ReferenceHost host(scene);
    ASSERT_EQ(KXSetKeyTime(1.0, 0, 0), S_OK); // the current container now differs from a new one
    struct Outcome {
        HRESULT result;
        double seconds;
    };
    // Host calls in order: current container, key-time property, its value, then the conversion's
    // time manager and its format.
    const Outcome reads[] = {
        {S_OK, 1.0},                  // clean
        {S_OK, 0.5},                  // no current container: a new one, at the host's key frame
        {S_OK, 0.25},                 // no key-time property: the current time, the play position
        {E_FAIL, -1.0}, {S_OK, 24.0}, // frames counted one a second
        {S_OK, 24.0},
    };
    for (int n = 1;; ++n) {
        ut::test::LiveObjectCheck live;
        ut::test::FaultPlan plan(n);
        double seconds = -1.0;
        HRESULT hr = KXGetKeyTime(&seconds);
        int row = plan.Fired() ? n : 0;
        ASSERT_LT(row, 6);
        EXPECT_EQ(hr, reads[row].result) << "host call " << n;
        EXPECT_EQ(seconds, reads[row].seconds) << "host call " << n;
        if (!plan.Fired())
            break;
    }
    // Host calls in order: current container, key-time property, time manager, format, the
    // parameter's setter, the refresh.
    const Outcome writes[] = {
        {S_OK, 2.0},                                      // clean
        {S_OK, 1.0},                                      // a new container took the time and went
        {E_FAIL, 1.0},                                    // no key-time property
        {S_OK, 2.0 / 24.0},                               // 2 seconds counted as 2 frames
        {S_OK, 2.0 / 24.0}, {E_FAIL, 1.0}, {E_FAIL, 2.0}, // the refresh failed after the time was set
    };
    for (int n = 1;; ++n) {
        HRESULT hr = S_OK;
        bool fired = false;
        {
            ut::test::LiveObjectCheck live;
            ut::test::FaultPlan plan(n);
            hr = KXSetKeyTime(2.0, 1, 1);
            fired = plan.Fired();
        }
        int row = fired ? n : 0;
        ASSERT_LT(row, 7);
        EXPECT_EQ(hr, writes[row].result) << "host call " << n;
        EXPECT_DOUBLE_EQ(KeyTime(), writes[row].seconds) << "host call " << n;
        ASSERT_EQ(KXSetKeyTime(1.0, 0, 0), S_OK);
        if (!fired)
            break;
    }
}

TEST_F(TimeTest, AFailingContainerCreationIsReturned) {
    ut::host::ReferenceHost host({.currentContainer = false});
    // Current container, then the creation and the class's factory.
    for (int n = 2; n <= 3; ++n) {
        ut::test::LiveObjectCheck live;
        ut::test::FaultPlan plan(n, E_ACCESSDENIED);
        double seconds = -1.0;
        EXPECT_EQ(KXGetKeyTime(&seconds), E_ACCESSDENIED) << "host call " << n;
        EXPECT_EQ(seconds, -1.0);
        EXPECT_EQ(KXSetKeyTime(1.0, 1, 1), S_OK) << "host call " << n << " is past";
    }
}

} // namespace
