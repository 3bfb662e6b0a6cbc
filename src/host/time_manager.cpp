#include "time_manager.h"

#include <ut/sdk/testing.h>

namespace ut::host {
namespace {

// A frame count of the scene, as a time in seconds.
CGWTime SceneTime(const Settings& settings, double frames) {
    CGWTime time(settings.timeFormat, 0.0, settings.frameRate);
    time.SetTime(time.toSeconds(frames));
    return time;
}

} // namespace

TimeManager::TimeManager(const Settings& settings)
    : format_(settings.timeFormat), rate_(settings.frameRate), display_(settings.timeDisplay) {}

std::span<const CGWCOMObject::InterfaceEntry> TimeManager::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<TimeManager, IGWTimeManager>(IID_IGWTimeManager)};
    return map;
}

HRESULT TimeManager::GetFormat(GWTIMEFORMATTYPE type, tagGWTIMEFORMAT* format, double* rate) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWTimeManager::GetFormat"); FAILED(hr))
        return hr;
    if (type != GWTIMEFORMATTYPE_SCENE)
        return E_INVALIDARG;
    if (format)
        *format = format_;
    if (rate)
        *rate = rate_;
    return S_OK;
}

HRESULT TimeManager::GetDisplayFormat(GWTIMEDISPLAYFORMAT* display, tagGWTIMEFORMAT* format, double* rate) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWTimeManager::GetDisplayFormat"); FAILED(hr))
        return hr;
    if (display)
        *display = display_;
    if (format)
        *format = format_;
    if (rate)
        *rate = rate_;
    return S_OK;
}

PlayControl::PlayControl(const Settings& settings) : position_(SceneTime(settings, settings.playFrame)) {
    settings_.size = sizeof settings_;
    settings_.mask = GWPLAYSET_ALL;
    settings_.span =
        CGWTimeSpan(SceneTime(settings, settings.firstFrame), SceneTime(settings, settings.lastFrame))
            .ToRecord();
    settings_.position = position_.GetTime();
    settings_.mode = GWPLAYMODE_REALTIME;
    settings_.format = settings.timeFormat;
    settings_.speed = 1.0;
    settings_.realTime = 1;
    settings_.step = 1;
}

std::span<const CGWCOMObject::InterfaceEntry> PlayControl::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<PlayControl, IGWPlayControl>(IID_IGWPlayControl)};
    return map;
}

HRESULT PlayControl::GetTime(tagGWTIME* time) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWPlayControl::GetTime"); FAILED(hr))
        return hr;
    if (!time)
        return E_POINTER;
    *time = position_.ToRecord();
    return S_OK;
}

HRESULT PlayControl::GetTimeSpan(tagGWTIMESPAN* span) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWPlayControl::GetTimeSpan"); FAILED(hr))
        return hr;
    if (!span)
        return E_POINTER;
    *span = settings_.span;
    return S_OK;
}

HRESULT PlayControl::SetSettings(const tagGWPLAYCONTROLSETTINGS* settings) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWPlayControl::SetSettings"); FAILED(hr))
        return hr;
    if (!settings)
        return E_POINTER;
    if (settings->size != sizeof *settings || (settings->mask & ~GWPLAYSET_ALL))
        return E_INVALIDARG;
    const ULONG mask = settings->mask;
    auto take = [&](ULONG bit, auto member) {
        if (mask & bit)
            settings_.*member = settings->*member;
    };
    take(GWPLAYSET_SPAN, &tagGWPLAYCONTROLSETTINGS::span);
    take(GWPLAYSET_POSITION, &tagGWPLAYCONTROLSETTINGS::position);
    take(GWPLAYSET_LOOP, &tagGWPLAYCONTROLSETTINGS::loop);
    take(GWPLAYSET_PREROLL, &tagGWPLAYCONTROLSETTINGS::preroll);
    take(GWPLAYSET_MODE, &tagGWPLAYCONTROLSETTINGS::mode);
    take(GWPLAYSET_FORMAT, &tagGWPLAYCONTROLSETTINGS::format);
    take(GWPLAYSET_SPEED, &tagGWPLAYCONTROLSETTINGS::speed);
    take(GWPLAYSET_REALTIME, &tagGWPLAYCONTROLSETTINGS::realTime);
    take(GWPLAYSET_STEP, &tagGWPLAYCONTROLSETTINGS::step);
    take(GWPLAYSET_SCRUB, &tagGWPLAYCONTROLSETTINGS::scrub);
    take(GWPLAYSET_AUDIOOFFSET, &tagGWPLAYCONTROLSETTINGS::audioOffset);
    if (mask & GWPLAYSET_POSITION)
        position_.SetTime(settings->position);
    return S_OK;
}

HRESULT PlayControl::GetSettings(tagGWPLAYCONTROLSETTINGS* settings) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWPlayControl::GetSettings"); FAILED(hr))
        return hr;
    if (!settings)
        return E_POINTER;
    *settings = settings_;
    return S_OK;
}

} // namespace ut::host
