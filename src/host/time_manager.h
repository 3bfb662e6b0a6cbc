// The reference host's time manager and play control: the scene's format and rate, its display
// format, and a play position and range, all fixed by the settings.
#pragma once

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/play.h>
#include <ut/sdk/time.h>

namespace ut::host {

class TimeManager final : public ut::sdk::ComObject<IGWTimeManager> {
public:
    explicit TimeManager(const Settings& settings);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetFormat(GWTIMEFORMATTYPE type, tagGWTIMEFORMAT* format,
                                        double* rate) override;
    HRESULT STDMETHODCALLTYPE GetDisplayFormat(GWTIMEDISPLAYFORMAT* display, tagGWTIMEFORMAT* format,
                                               double* rate) override;

private:
    tagGWTIMEFORMAT format_;
    double rate_;
    GWTIMEDISPLAYFORMAT display_;
};

// Times are handed out in seconds, in the scene's format and rate.
class PlayControl final : public ut::sdk::ComObject<IGWPlayControl> {
public:
    explicit PlayControl(const Settings& settings);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetTime(tagGWTIME* time) override;
    HRESULT STDMETHODCALLTYPE GetTimeSpan(tagGWTIMESPAN* span) override;

private:
    CGWTime position_;
    CGWTimeSpan span_;
};

} // namespace ut::host
