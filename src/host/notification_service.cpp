// The reference host's notification service: sinks advised by name, re-entrant broadcasts.
#include "notification_service.h"

#include <algorithm>
#include <string_view>

namespace ut::host {
namespace {

template <class Sinks>
auto FindSink(Sinks& sinks, IGwNotifySink* sink) {
    return std::find_if(sinks.begin(), sinks.end(), [sink](const auto& held) { return held.Get() == sink; });
}

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> NotificationService::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<NotificationService, IGWNotificationService>(IID_IGWNotificationService)};
    return map;
}

HRESULT NotificationService::Advise(const wchar_t* name, IGwNotifySink* sink) {
    if (!name || !sink)
        return E_POINTER;
    if (!*name)
        return E_INVALIDARG;
    Sinks& advised = sinks_[name];
    if (FindSink(advised, sink) != advised.end())
        return S_FALSE;
    advised.emplace_back(sink);
    return S_OK;
}

HRESULT NotificationService::Unadvise(const wchar_t* name, IGwNotifySink* sink) {
    if (!name || !sink)
        return E_POINTER;
    auto entry = sinks_.find(std::wstring_view(name));
    if (entry == sinks_.end())
        return S_FALSE;
    auto found = FindSink(entry->second, sink);
    if (found == entry->second.end())
        return S_FALSE;
    // The sink may be inside its own PropertyChanged: the broadcast holds it until it returns.
    entry->second.erase(found);
    if (entry->second.empty())
        sinks_.erase(entry);
    return S_OK;
}

HRESULT NotificationService::Broadcast(const wchar_t* name, ULONG kind, const VARIANT* value) {
    if (!name)
        return E_POINTER;
    auto entry = sinks_.find(std::wstring_view(name));
    if (entry == sinks_.end())
        return S_FALSE;
    // Sinks may change the registrations while they are called, so the broadcast walks a copy of
    // the pointers and calls each only while it is still advised. A reference is taken just for
    // the call: a sink that is not reference-counted may already be gone once it is unadvised.
    std::vector<IGwNotifySink*> targets;
    targets.reserve(entry->second.size());
    for (const ComPtr<IGwNotifySink>& sink : entry->second)
        targets.push_back(sink.Get());
    HRESULT result = S_OK;
    for (IGwNotifySink* target : targets) {
        if (!IsAdvised(name, target))
            continue;
        ComPtr<IGwNotifySink> held(target);
        HRESULT hr = held->PropertyChanged(name, kind, value, 0);
        if (FAILED(hr) && SUCCEEDED(result))
            result = hr;
    }
    return result;
}

bool NotificationService::IsAdvised(const wchar_t* name, IGwNotifySink* sink) const {
    auto entry = sinks_.find(std::wstring_view(name));
    if (entry == sinks_.end())
        return false;
    return FindSink(entry->second, sink) != entry->second.end();
}

} // namespace ut::host
