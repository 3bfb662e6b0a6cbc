// The reference host's ambient values manager: a name-to-value store, seeded from the settings.
//
// Every value is kept as a LONG; a boolean is stored as 0 or 1, so that reading either kind back
// as the other converts the way the interface describes.
#pragma once

#include <functional>
#include <map>
#include <mutex>
#include <string>

#include <ut/host/reference_host.h>
#include <ut/sdk/ambient.h>
#include <ut/sdk/comobject.h>

namespace ut::host {

class AmbientValues final : public ut::sdk::ComObject<IGWAmbientValues> {
public:
    explicit AmbientValues(const Settings& settings);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetBool(const wchar_t* name, BOOL* value) override;
    HRESULT STDMETHODCALLTYPE GetInt(const wchar_t* name, LONG* value) override;
    HRESULT STDMETHODCALLTYPE SetBool(const wchar_t* name, BOOL value) override;
    HRESULT STDMETHODCALLTYPE SetInt(const wchar_t* name, LONG value) override;

private:
    // Leaves *value as it was unless the name is found.
    HRESULT Read(std::string_view operation, const wchar_t* name, LONG* value);
    HRESULT Write(std::string_view operation, const wchar_t* name, LONG value);

    std::mutex mutex_;
    std::map<std::wstring, LONG, std::less<>> values_;
};

} // namespace ut::host
