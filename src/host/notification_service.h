// The reference host's notification service: sinks advised by notification name, and broadcasts
// to them that survive sinks advising and unadvising from inside their own call.
#pragma once

#include <functional>
#include <map>
#include <string>
#include <vector>

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/notify.h>

namespace ut::host {

class NotificationService final : public ut::sdk::ComObject<IGWNotificationService> {
public:
    // Nothing in the settings concerns notifications.
    explicit NotificationService(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE Advise(const wchar_t* name, IGwNotifySink* sink) override;
    HRESULT STDMETHODCALLTYPE Unadvise(const wchar_t* name, IGwNotifySink* sink) override;
    HRESULT STDMETHODCALLTYPE Broadcast(const wchar_t* name, ULONG kind, const VARIANT* value) override;

private:
    using Sinks = std::vector<ComPtr<IGwNotifySink>>;

    bool IsAdvised(const wchar_t* name, IGwNotifySink* sink) const;

    // Advise order per name; a name whose last sink goes is erased.
    std::map<std::wstring, Sinks, std::less<>> sinks_;
};

} // namespace ut::host
