// The time family: the scene's format, frame and second conversions, and the current, render and
// key times.
#include <cmath>
#include <cstring>
#include <limits>

#include <ut/sdk/content.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/play.h>
#include <ut/sdk/variant.h>
#include <ut/time.h>

#include "module/state.h"

namespace ut::util {
namespace {

// What the scene is taken to count in when the time manager cannot say.
constexpr tagGWTIMEFORMAT kFallbackFormat = GWTIMEFORMAT_SECONDS;
constexpr double kFallbackRate = 1.0;

// The formats whose rate is the manager's; every other format's rate follows from the format.
bool RateIsTheManagers(tagGWTIMEFORMAT format) {
    return format == GWTIMEFORMAT_FRAMES || format == GWTIMEFORMAT_FIELDS || format == GWTIMEFORMAT_SAMPLES;
}

ut::module::TimeState* Time() {
    return ut::module::Current().time.get();
}

// The time state for an export that needs `pointer`: E_POINTER without it, E_UNEXPECTED when the
// library did not load.
HRESULT TimeFor(const void* pointer, ut::module::TimeState*& state) {
    if (!pointer)
        return E_POINTER;
    state = Time();
    return state ? S_OK : E_UNEXPECTED;
}

// Turns the manager's answer into the function's result, putting the fallback in place of a
// failed answer. Only 0 counts as an answer.
HRESULT AcceptOrFallBack(HRESULT managerResult, tagGWTIMEFORMAT& format, double& rate) {
    if (managerResult == S_OK)
        return S_OK;
    format = kFallbackFormat;
    rate = kFallbackRate;
    return S_FALSE;
}

HRESULT SceneFormat(tagGWTIMEFORMAT& format, double& rate) {
    ut::module::TimeState* time = Time();
    HRESULT hr =
        time ? time->timeManager.GetTimeFormatW(GWTIMEFORMATTYPE_SCENE, &format, &rate) : E_UNEXPECTED;
    return AcceptOrFallBack(hr, format, rate);
}

// Asks the time manager with `query`, falls back when it fails, and stores what the caller asked
// for, with the units a second of the format and rate.
template <class Query>
HRESULT ReportFormat(Query query, tagGWTIMEFORMAT* format, double* rate, double* ticksPerSecond) {
    ut::module::TimeState* time = Time();
    if (!time)
        return E_UNEXPECTED;
    tagGWTIMEFORMAT sceneFormat = kFallbackFormat;
    double sceneRate = kFallbackRate;
    HRESULT hr = AcceptOrFallBack(query(time->timeManager, sceneFormat, sceneRate), sceneFormat, sceneRate);
    if (format)
        *format = sceneFormat;
    if (rate)
        *rate = sceneRate;
    if (ticksPerSecond)
        *ticksPerSecond = CGWTime(sceneFormat, 0.0, sceneRate).GetTicksPerSecond();
    return hr;
}

// The time object the conversions count with.
CGWTime ConversionTime() {
    tagGWTIMEFORMAT format = kFallbackFormat;
    double rate = kFallbackRate;
    (void)SceneFormat(format, rate); // a failing manager is answered with the fallback
    CGWTime time;
    time.SetFormat(format);
    time.SetRate(RateIsTheManagers(format) ? rate : time.GetTicksPerSecond());
    return time;
}

// A variant zeroed for the host to fill, cleared afterwards only when its type can own something:
// the string and object types from VT_BSTR up, except the boolean.
class HostVariant {
public:
    HostVariant() noexcept { std::memset(&value_, 0, sizeof value_); }
    ~HostVariant() {
        if (value_.vt >= VT_BSTR && value_.vt != VT_BOOL)
            (void)GWVariantClear(&value_); // nothing to report from a destructor
    }
    HostVariant(const HostVariant&) = delete;
    HostVariant& operator=(const HostVariant&) = delete;

    GWVARIANT* Get() noexcept { return &value_; }

private:
    GWVARIANT value_;
};

ut::ComPtr<IGWPlayControl> FindPlayControl(HRESULT& hr) {
    ut::ComPtr<IGWPlayControl> play;
    hr = GWQueryGenericObject(CLSID_GWPlayControl, IID_IGWPlayControl, play.PutVoid());
    return play;
}

// The play control's position, or the start of its range, or 0 seconds.
CGWTime PlayPosition(IGWPlayControl& play) {
    CGWTime position;
    tagGWTIME now = position.ToRecord();
    if (play.GetTime(&now) == S_OK)
        return CGWTime(now);
    tagGWTIMESPAN span = {position.ToRecord(), position.ToRecord()};
    if (play.GetTimeSpan(&span) == S_OK)
        return CGWTime(span.start);
    position.SetTime(0.0);
    return position;
}

// The current content container, or a new one when none is current.
HRESULT CurrentOrNewContainer(ut::ComPtr<IGWContentContainer>& container) {
    if (SUCCEEDED(GWContentGetCurrentContainer(IID_IGWContentContainer, container.PutVoid())) && container)
        return S_OK;
    return KXCreateInstance(CLSID_GWContentContainer, IID_IGWContentContainer, container.PutVoid());
}

// The key-time property of the current (or a new) content container. The result is the failure
// to reach a container (or a library that did not load); `found` is the property's lookup, which
// fails when the container has none.
HRESULT OpenKeyTime(ut::ComPtr<IGWProperty>& keyTime, HRESULT& found) {
    if (!ut::module::Loaded())
        return E_UNEXPECTED;
    ut::ComPtr<IGWContentContainer> container;
    if (HRESULT hr = CurrentOrNewContainer(container); FAILED(hr))
        return hr;
    found = container->FindProperty(GUID_GWKeyTimeProperty, IID_IGWProperty, keyTime.PutVoid());
    if (SUCCEEDED(found) && !keyTime)
        found = E_NOINTERFACE;
    return S_OK;
}

HRESULT SetKeyTimeValue(IGWProperty& keyTime, const tagGWREQUEST& request, const GWVARIANT& frames,
                        bool throughParameter) {
    if (!throughParameter)
        return keyTime.SetValue(&request, &frames);
    ut::ComPtr<IGWParameter> parameter;
    if (HRESULT hr = keyTime.QueryInterface(IID_IGWParameter, parameter.PutVoid()); FAILED(hr))
        return hr;
    return parameter->SetParamValue(&request, &frames);
}

} // namespace
} // namespace ut::util

HRESULT KXSetCurrentRenderTime(tagGWTIME* time) {
    ut::module::TimeState* state = nullptr;
    if (HRESULT hr = ut::util::TimeFor(time, state); FAILED(hr))
        return hr;
    state->renderTime = CGWTime(*time);
    return S_OK;
}

HRESULT KXGetTimeFormat(tagGWTIMEFORMAT* format, double* rate, double* ticksPerSecond) {
    return ut::util::ReportFormat(
        [](const CGWTimeManagerHelper& manager, tagGWTIMEFORMAT& sceneFormat, double& sceneRate) {
            return manager.GetTimeFormatW(GWTIMEFORMATTYPE_SCENE, &sceneFormat, &sceneRate);
        },
        format, rate, ticksPerSecond);
}

HRESULT KXGetDisplayTimeFormat(GWTIMEDISPLAYFORMAT* display, tagGWTIMEFORMAT* format, double* rate,
                               double* ticksPerSecond) {
    return ut::util::ReportFormat(
        [display](const CGWTimeManagerHelper& manager, tagGWTIMEFORMAT& sceneFormat, double& sceneRate) {
            return manager.GetDisplayFormat(display, &sceneFormat, &sceneRate);
        },
        format, rate, ticksPerSecond);
}

double KXFramesToSeconds(double frames) {
    return ut::util::ConversionTime().toSeconds(frames);
}

double KXSecondsToFrames(double seconds) {
    return ut::util::ConversionTime().toUnits(seconds);
}

LONG KXSecondsToNearestFrame(double seconds) {
    constexpr LONG kIndefinite = std::numeric_limits<LONG>::min();
    double frame = std::floor(ut::util::ConversionTime().toUnits(seconds) + CGWTime::Epsilon);
    if (!(frame >= static_cast<double>(kIndefinite) &&
          frame <= static_cast<double>(std::numeric_limits<LONG>::max())))
        return kIndefinite;
    return static_cast<LONG>(frame);
}

HRESULT KXGetCurrentTime(tagGWTIME* time) {
    ut::module::TimeState* state = nullptr;
    if (HRESULT hr = ut::util::TimeFor(time, state); FAILED(hr))
        return hr;
    if (state->renderTime.IsDefined()) {
        *time = state->renderTime.ToRecord();
        return S_OK;
    }
    HRESULT found = S_OK;
    ut::ComPtr<IGWPlayControl> play = ut::util::FindPlayControl(found);
    *time = play ? ut::util::PlayPosition(*play).ToRecord() : CGWTime().ToRecord();
    return S_OK;
}

HRESULT KXGetCurrentTimeSpan(tagGWTIMESPAN* span) {
    if (!span)
        return E_POINTER;
    if (!ut::module::Loaded())
        return E_UNEXPECTED;
    HRESULT hr = S_OK;
    ut::ComPtr<IGWPlayControl> play = ut::util::FindPlayControl(hr);
    return play ? play->GetTimeSpan(span) : hr;
}

HRESULT KXGetKeyTime(double* seconds) {
    if (!seconds)
        return E_POINTER;
    ut::ComPtr<IGWProperty> keyTime;
    HRESULT found = S_OK;
    if (HRESULT hr = ut::util::OpenKeyTime(keyTime, found); FAILED(hr))
        return hr;
    if (FAILED(found)) {
        tagGWTIME now{};
        HRESULT hr = KXGetCurrentTime(&now);
        if (SUCCEEDED(hr))
            *seconds = now.time;
        return hr;
    }
    ut::util::HostVariant frames;
    if (HRESULT hr = keyTime->GetParameterValue(GUID_GWValueParameter, frames.Get()); FAILED(hr))
        return hr;
    *seconds = KXFramesToSeconds(frames.Get()->dblVal);
    return S_OK;
}

HRESULT KXSetKeyTime(double seconds, int refresh, int throughParameter) {
    ut::ComPtr<IGWProperty> keyTime;
    HRESULT found = S_OK;
    if (HRESULT hr = ut::util::OpenKeyTime(keyTime, found); FAILED(hr))
        return hr;
    if (FAILED(found))
        return found;
    CGWVariant frames(KXSecondsToFrames(seconds));
    const tagGWREQUEST request = {GWREQUEST_PLUGIN};
    if (HRESULT hr = ut::util::SetKeyTimeValue(*keyTime, request, frames, throughParameter != 0); FAILED(hr))
        return hr;
    if (refresh) {
        if (HRESULT hr = keyTime->Refresh(&request, TRUE, 0, 0); FAILED(hr))
            return hr;
    }
    return S_OK;
}
