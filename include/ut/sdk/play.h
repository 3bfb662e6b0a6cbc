// The application's play control: where playback stands, which range it plays and how, set and
// read through one settings record.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/time.h>

// {7C607920-8022-11CE-85B7-00AA006294A2}
inline constexpr CLSID CLSID_GWPlayControl = {
    0x7C607920, 0x8022, 0x11CE, {0x85, 0xB7, 0x00, 0xAA, 0x00, 0x62, 0x94, 0xA2}};
// {975F8F60-6A21-11CF-AF66-524153480001}
inline constexpr IID IID_IGWPlayControl = {
    0x975F8F60, 0x6A21, 0x11CF, {0xAF, 0x66, 0x52, 0x41, 0x53, 0x48, 0x00, 0x01}};

// The bits of tagGWPLAYCONTROLSETTINGS::mask, one per field, in the record's order.
enum GWPLAYSETTING : ULONG {
    GWPLAYSET_SPAN = 0x001,
    GWPLAYSET_POSITION = 0x002,
    GWPLAYSET_LOOP = 0x004,
    GWPLAYSET_PREROLL = 0x008,
    GWPLAYSET_MODE = 0x010,
    GWPLAYSET_FORMAT = 0x020,
    GWPLAYSET_SPEED = 0x040,
    GWPLAYSET_REALTIME = 0x080,
    GWPLAYSET_STEP = 0x100,
    GWPLAYSET_SCRUB = 0x200,
    GWPLAYSET_AUDIOOFFSET = 0x400,
    GWPLAYSET_ALL = 0x7FF,
};

// How playback steps through the range.
enum GWPLAYMODE : LONG {
    GWPLAYMODE_REALTIME = 1, // skips frames to keep time
    GWPLAYMODE_ALLFRAMES = 2,
};

// The play control's settings. `size` is the record's size and `mask` says which fields are set
// (or, when read, valid); the other fields count only where their bit is set.
struct tagGWPLAYCONTROLSETTINGS {
    ULONG size;
    ULONG mask;
    tagGWTIMESPAN span;     // the range played
    double position;        // the play position, in seconds
    LONG loop;              // non-zero plays the range over and over
    LONG preroll;           // frames played before the range
    GWPLAYMODE mode;        // how playback steps
    tagGWTIMEFORMAT format; // the format times are shown in
    double speed;           // 1.0 plays in real time
    LONG realTime;          // non-zero follows the clock rather than the frames
    LONG step;              // frames one step moves
    LONG scrub;             // non-zero plays sound while the position is dragged
    LONG audioOffset;       // frames the sound is moved by
    BYTE reserved[344];     // the host's; zero
};
static_assert(sizeof(tagGWPLAYCONTROLSETTINGS) == 448);

// A null output answers E_POINTER; on failure the output is left as it was.
struct IGWPlayControl : IUnknown {
    // The play position, in the scene's format and rate.
    virtual HRESULT STDMETHODCALLTYPE GetTime(tagGWTIME* time) = 0;
    // The range that playback runs over.
    virtual HRESULT STDMETHODCALLTYPE GetTimeSpan(tagGWTIMESPAN* span) = 0;
    // Applies the fields of `settings` that its mask names; E_INVALIDARG for a record of another
    // size.
    virtual HRESULT STDMETHODCALLTYPE SetSettings(const tagGWPLAYCONTROLSETTINGS* settings) = 0;
    // Fills the record whole (size and mask included).
    virtual HRESULT STDMETHODCALLTYPE GetSettings(tagGWPLAYCONTROLSETTINGS* settings) = 0;

protected:
    ~IGWPlayControl() = default;
};

template <>
struct ut::InterfaceId<IGWPlayControl> : ut::Iid<IID_IGWPlayControl> {};
