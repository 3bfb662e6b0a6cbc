// Time: the scene's time format, conversions between frames and seconds, and the current,
// render and key times.
//
// The scene's format and rate come from the application's time manager. When it cannot answer,
// the scene is taken to count in GWTIMEFORMAT_SECONDS at rate 1. Conversions use the manager's
// rate only for the formats FRAMES, FIELDS and SAMPLES; for every other format they use the
// units a second that CGWTime gives the format (an unnamed format: 1).
//
// Every HRESULT function answers E_UNEXPECTED when the library did not load.
#pragma once

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/sdk/time.h>

// Stores `time` as the render time, without validating it. While the render time is finite,
// KXGetCurrentTime answers it instead of the play position; storing CGWTime::Undefined hands the
// current time back to the play control. E_POINTER for a null `time`, otherwise S_OK.
UT_API HRESULT KXSetCurrentRenderTime(tagGWTIME* time);

// The scene's format and rate and its units a second; each output may be null. S_OK, or S_FALSE
// when the time manager failed and the outputs hold GWTIMEFORMAT_SECONDS, 1.0 and 1.0.
UT_API HRESULT KXGetTimeFormat(tagGWTIMEFORMAT* format, double* rate, double* ticksPerSecond);
// The same with the display format first. On S_FALSE `display` holds whatever the failed query
// left in it (usually what it held before).
UT_API HRESULT KXGetDisplayTimeFormat(GWTIMEDISPLAYFORMAT* display, tagGWTIMEFORMAT* format, double* rate,
                                      double* ticksPerSecond);

// Scene units (frames) and seconds; they never fail.
UT_API double KXFramesToSeconds(double frames);
// Not rounded.
UT_API double KXSecondsToFrames(double seconds);
// The frame at or before `seconds`, after adding CGWTime::Epsilon frames: 23.6 frames give 23,
// 24 - Epsilon/2 frames give 24, -0.5 frames give -1. A result outside the 32-bit range, or NaN,
// gives LONG_MIN, as the 32-bit home's conversion does.
UT_API LONG KXSecondsToNearestFrame(double seconds);

// The render time when it is finite; otherwise the play control's position, or the start of its
// range when the position cannot be read, or 0 seconds in the default format when neither can.
// A missing play control gives a default CGWTime. E_POINTER for a null `time`, otherwise S_OK.
UT_API HRESULT KXGetCurrentTime(tagGWTIME* time);
// The play control's range, or the failure to find or ask it.
UT_API HRESULT KXGetCurrentTimeSpan(tagGWTIMESPAN* span);

// The key time of the current content container (one is created when none is current), in
// seconds: its key-time property's value parameter, which counts frames. Without a key-time
// property, the current time. S_OK, or the first failure met.
UT_API HRESULT KXGetKeyTime(double* seconds);
// Sets the key time in seconds, through the property's value setter or, when `throughParameter`
// is non-zero, through its IGWParameter; then, when `refresh` is non-zero, refreshes the property.
// S_OK, or the first failure met.
UT_API HRESULT KXSetKeyTime(double seconds, int refresh, int throughParameter);
