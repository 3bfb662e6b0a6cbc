// Host time: time formats and their rates, the time value CGWTime and its plain records, and the
// application's time manager, which says in which format and at which rate the scene counts.
//
// A time value is always in seconds; a format says what a "unit" is (a frame, a field, a sample)
// and how many units make a second (GetTicksPerSecond). Most formats fix that number; the
// formats FRAMES, FIELDS and SAMPLES, and values this header does not name, take the rate the
// time carries.
#pragma once

#include <cmath>

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

enum tagGWTIMEFORMAT : LONG {
    GWTIMEFORMAT_FILM = 1,          // 24 frames a second
    GWTIMEFORMAT_PAL = 2,           // 25 frames a second
    GWTIMEFORMAT_NTSC = 3,          // 30000/1001 frames a second
    GWTIMEFORMAT_VIDEO30 = 4,       // 30 frames a second
    GWTIMEFORMAT_PAL_FIELDS = 5,    // 50 fields a second
    GWTIMEFORMAT_NTSC_FIELDS = 6,   // 60000/1001 fields a second
    GWTIMEFORMAT_VIDEO60 = 7,       // 60 frames a second
    GWTIMEFORMAT_SECONDS = 10,      // one unit a second; also what is used when nothing else is known
    GWTIMEFORMAT_FRAMES = 11,       // frames at the time's own rate
    GWTIMEFORMAT_FIELDS = 12,       // fields at the time's own rate
    GWTIMEFORMAT_MILLISECONDS = 20, // 1000 units a second
    GWTIMEFORMAT_SAMPLES = 31,      // audio samples at the time's own rate
};

// Which format the time manager is asked for.
enum GWTIMEFORMATTYPE : LONG {
    GWTIMEFORMATTYPE_SCENE = 0, // the current scene's
};

// How times are shown to the user.
enum GWTIMEDISPLAYFORMAT : LONG {
    GWTIMEDISPLAY_FRAMES = 0,   // a unit count
    GWTIMEDISPLAY_TIMECODE = 1, // hours:minutes:seconds:frames
    GWTIMEDISPLAY_SECONDS = 2,  // seconds with a fraction
};

// The plain time record: a format, its rate (units a second) and a time in seconds.
struct tagGWTIME {
    tagGWTIMEFORMAT format;
    double rate;
    double time;
};

// A range of time; `start` comes first.
struct tagGWTIMESPAN {
    tagGWTIME start;
    tagGWTIME end;
};

// A time value: format, rate and time (in seconds), copied whole.
class UT_SDK_API CGWTime {
public:
    // The tolerance, in units, added to a unit count before it is rounded down to a whole unit.
    static constexpr double Epsilon = 1.0e-6;
    // A time whose value is not finite (NaN), in seconds at rate 1: "no time".
    static const CGWTime Undefined;

    // 0 seconds in GWTIMEFORMAT_SECONDS at rate 1.
    CGWTime() = default;
    CGWTime(const tagGWTIME& record) : format_(record.format), rate_(record.rate), time_(record.time) {}
    // Note the order: the time comes before the rate.
    CGWTime(tagGWTIMEFORMAT format, double time, double rate) : format_(format), rate_(rate), time_(time) {}

    tagGWTIMEFORMAT GetFormat() const { return format_; }
    double GetRate() const { return rate_; }
    double GetTime() const { return time_; }
    void SetFormat(tagGWTIMEFORMAT format) { format_ = format; }
    void SetRate(double rate) { rate_ = rate; }
    void SetTime(double seconds) { time_ = seconds; }
    // A time that is neither infinite nor NaN.
    bool IsDefined() const { return std::isfinite(time_); }

    tagGWTIME ToRecord() const { return {format_, rate_, time_}; }

    // Units a second: fixed by the format, or the rate for FRAMES, FIELDS, SAMPLES and unnamed
    // formats.
    double GetTicksPerSecond() const;
    // Seconds in `units` units, and units in `seconds` seconds, by GetTicksPerSecond. A rate of 0
    // gives infinities, as the arithmetic does.
    double toSeconds(double units) const { return units / GetTicksPerSecond(); }
    double toUnits(double seconds) const { return seconds * GetTicksPerSecond(); }

private:
    tagGWTIMEFORMAT format_ = GWTIMEFORMAT_SECONDS;
    double rate_ = 1.0;
    double time_ = 0.0;
};

// A range of time as two CGWTime values.
class UT_SDK_API CGWTimeSpan {
public:
    CGWTimeSpan() = default;
    CGWTimeSpan(const tagGWTIMESPAN& record) : start_(record.start), end_(record.end) {}
    CGWTimeSpan(const CGWTime& start, const CGWTime& end) : start_(start), end_(end) {}

    const CGWTime& GetStart() const { return start_; }
    const CGWTime& GetEnd() const { return end_; }
    // End minus start, in seconds.
    double GetDuration() const { return end_.GetTime() - start_.GetTime(); }
    tagGWTIMESPAN ToRecord() const { return {start_.ToRecord(), end_.ToRecord()}; }

private:
    CGWTime start_;
    CGWTime end_;
};

// {8A4469EC-5C22-48C0-ACD3-315EF7E3F66B} (the reference host's; an application installs its own
// time manager under this class)
inline constexpr CLSID CLSID_GWTimeManager = {
    0x8A4469EC, 0x5C22, 0x48C0, {0xAC, 0xD3, 0x31, 0x5E, 0xF7, 0xE3, 0xF6, 0x6B}};
// {8A4469ED-5C22-48C0-ACD3-315EF7E3F66B}
inline constexpr IID IID_IGWTimeManager = {
    0x8A4469ED, 0x5C22, 0x48C0, {0xAC, 0xD3, 0x31, 0x5E, 0xF7, 0xE3, 0xF6, 0x6B}};

// Every output may be null (it is then not written); on failure the outputs are left as they were.
struct IGWTimeManager : IUnknown {
    // The format and rate of `type`; E_INVALIDARG for a type the manager does not know.
    virtual HRESULT STDMETHODCALLTYPE GetFormat(GWTIMEFORMATTYPE type, tagGWTIMEFORMAT* format,
                                                double* rate) = 0;
    // How the scene's times are shown, with the scene's format and rate.
    virtual HRESULT STDMETHODCALLTYPE GetDisplayFormat(GWTIMEDISPLAYFORMAT* display, tagGWTIMEFORMAT* format,
                                                       double* rate) = 0;

protected:
    ~IGWTimeManager() = default;
};

template <>
struct ut::InterfaceId<IGWTimeManager> : ut::Iid<IID_IGWTimeManager> {};

// The way to the application's time manager. It holds no reference: each call finds the manager
// anew, so a helper made before the application installed its services still reaches them.
// Both calls answer 0 on success, otherwise the failure of finding or asking the manager, with
// the outputs left as they were.
class UT_SDK_API CGWTimeManagerHelper {
public:
    HRESULT GetTimeFormatW(GWTIMEFORMATTYPE type, tagGWTIMEFORMAT* format, double* rate) const;
    HRESULT GetDisplayFormat(GWTIMEDISPLAYFORMAT* display, tagGWTIMEFORMAT* format, double* rate) const;
};
