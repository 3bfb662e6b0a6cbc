// The reference host's active database: it reports the mode of its settings.
#pragma once

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/database.h>

namespace ut::host {

class ActiveDatabase final : public ut::sdk::ComObject<IGWActiveDatabase> {
public:
    explicit ActiveDatabase(const Settings& settings) : mode_(settings.activeDatabaseMode) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetCurrentMode(ULONG* mode) override;

private:
    ULONG mode_;
};

} // namespace ut::host
