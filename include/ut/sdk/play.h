// The application's play control: where playback stands and which range it plays.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/time.h>

// {7C607920-8022-11CE-85B7-00AA006294A2}
inline constexpr CLSID CLSID_GWPlayControl = {
    0x7C607920, 0x8022, 0x11CE, {0x85, 0xB7, 0x00, 0xAA, 0x00, 0x62, 0x94, 0xA2}};
// {975F8F60-6A21-11CF-AF66-524153480001}
inline constexpr IID IID_IGWPlayControl = {
    0x975F8F60, 0x6A21, 0x11CF, {0xAF, 0x66, 0x52, 0x41, 0x53, 0x48, 0x00, 0x01}};

// A null output answers E_POINTER; on failure the output is left as it was.
struct IGWPlayControl : IUnknown {
    // The play position, in the scene's format and rate.
    virtual HRESULT STDMETHODCALLTYPE GetTime(tagGWTIME* time) = 0;
    // The range that playback runs over.
    virtual HRESULT STDMETHODCALLTYPE GetTimeSpan(tagGWTIMESPAN* span) = 0;

protected:
    ~IGWPlayControl() = default;
};

template <>
struct ut::InterfaceId<IGWPlayControl> : ut::Iid<IID_IGWPlayControl> {};
