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

PlayControl::PlayControl(const Settings& settings)
    : position_(SceneTime(settings, settings.playFrame)),
      span_(SceneTime(settings, settings.firstFrame), SceneTime(settings, settings.lastFrame)) {}

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
    *span = span_.ToRecord();
    return S_OK;
}

} // namespace ut::host
