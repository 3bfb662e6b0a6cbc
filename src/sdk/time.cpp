// CGWTime's rates and the time-manager helper.
#include <limits>

#include <ut/sdk/objects.h>
#include <ut/sdk/time.h>

namespace {

struct FixedRate {
    tagGWTIMEFORMAT format;
    double ticksPerSecond;
};

constexpr FixedRate kFixedRates[] = {
    {GWTIMEFORMAT_FILM, 24.0},
    {GWTIMEFORMAT_PAL, 25.0},
    {GWTIMEFORMAT_NTSC, 30000.0 / 1001.0},
    {GWTIMEFORMAT_VIDEO30, 30.0},
    {GWTIMEFORMAT_PAL_FIELDS, 50.0},
    {GWTIMEFORMAT_NTSC_FIELDS, 60000.0 / 1001.0},
    {GWTIMEFORMAT_VIDEO60, 60.0},
    {GWTIMEFORMAT_SECONDS, 1.0},
    {GWTIMEFORMAT_MILLISECONDS, 1000.0},
};

ut::ComPtr<IGWTimeManager> FindTimeManager(HRESULT& hr) {
    ut::ComPtr<IGWTimeManager> manager;
    hr = GWQueryGenericObject(CLSID_GWTimeManager, IID_IGWTimeManager, manager.PutVoid());
    return manager;
}

} // namespace

const CGWTime CGWTime::Undefined(GWTIMEFORMAT_SECONDS, std::numeric_limits<double>::quiet_NaN(), 1.0);

double CGWTime::GetTicksPerSecond() const {
    for (const FixedRate& fixed : kFixedRates)
        if (fixed.format == format_)
            return fixed.ticksPerSecond;
    return rate_;
}

HRESULT CGWTimeManagerHelper::GetTimeFormatW(GWTIMEFORMATTYPE type, tagGWTIMEFORMAT* format,
                                             double* rate) const {
    HRESULT hr = S_OK;
    ut::ComPtr<IGWTimeManager> manager = FindTimeManager(hr);
    return manager ? manager->GetFormat(type, format, rate) : hr;
}

HRESULT CGWTimeManagerHelper::GetDisplayFormat(GWTIMEDISPLAYFORMAT* display, tagGWTIMEFORMAT* format,
                                               double* rate) const {
    HRESULT hr = S_OK;
    ut::ComPtr<IGWTimeManager> manager = FindTimeManager(hr);
    return manager ? manager->GetDisplayFormat(display, format, rate) : hr;
}
