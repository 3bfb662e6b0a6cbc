// The reference host's view manager: the view classes that modules registered, by identifier
// and by name, as ut/sdk/views.h describes.
#pragma once

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/views.h>

namespace ut::host {

class ViewManager final : public ut::sdk::ComObject<IGWViewManager> {
public:
    explicit ViewManager(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetViewName(REFCLSID view, wchar_t* name, ULONG capacity) override;
    HRESULT STDMETHODCALLTYPE GetViewClass(const wchar_t* name, CLSID* view) override;
};

} // namespace ut::host
