// A marker for the rare expectation that holds under wine but not on Windows itself.
#pragma once

#include <ut/platform/process.h>

namespace ut::test {

// True where the tests run under wine. Every use names why the expectation is wine's alone:
//   if (UnderWine("wine's registry sorts ... differently")) EXPECT_...;
inline bool UnderWine(const char* why) {
    (void)why; // documentation at the call site
    return ut::platform::RunningUnderCompatibilityLayer();
}

} // namespace ut::test
