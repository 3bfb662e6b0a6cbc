// The reference host's active database and application object: its mode, state flags, saving
// state, dump mode and object-event notifier.
#include "active_database.h"

#include <algorithm>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

namespace ut::host {

std::span<const CGWCOMObject::InterfaceEntry> ActiveDatabase::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<ActiveDatabase, IGWApplication>(IID_IGWApplication),
        ut::sdk::Entry<ActiveDatabase, IGWActiveDatabaseNotifier>(IID_IGWActiveDatabaseNotifier)};
    return map;
}

HRESULT ActiveDatabase::GetCurrentMode(ULONG* mode) {
    if (!mode)
        return E_POINTER;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabase::GetCurrentMode"); FAILED(hr))
        return hr;
    *mode = mode_;
    return S_OK;
}

HRESULT ActiveDatabase::SetStateFlags(ULONG flags, BOOL on) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabase::SetStateFlags"); FAILED(hr))
        return hr;
    flags_ = on ? (flags_ | flags) : (flags_ & ~flags);
    return S_OK;
}

HRESULT ActiveDatabase::TestStateFlags(ULONG flags) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabase::TestStateFlags"); FAILED(hr))
        return hr;
    return (flags_ & flags) == flags ? S_OK : S_FALSE;
}

HRESULT ActiveDatabase::GetStateFlag(ULONG flag, LONG* value) {
    if (!value)
        return E_POINTER;
    *value = 0;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabase::GetStateFlag"); FAILED(hr))
        return hr;
    if (flag >= numberedFlags_.size())
        return E_INVALIDARG;
    *value = numberedFlags_[flag];
    return S_OK;
}

HRESULT ActiveDatabase::SetStateFlag(ULONG flag, LONG value) {
    if (flag >= numberedFlags_.size())
        return E_INVALIDARG;
    numberedFlags_[flag] = value;
    return S_OK;
}

HRESULT ActiveDatabase::GetSavingState(GWSaveType* save, GWLoadType* load) {
    if (!save || !load)
        return E_POINTER;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabase::GetSavingState"); FAILED(hr))
        return hr;
    *save = save_;
    *load = load_;
    return S_OK;
}

HRESULT ActiveDatabase::SetSavingState(GWSaveType save, GWLoadType load) {
    save_ = save;
    load_ = load;
    return S_OK;
}

HRESULT ActiveDatabase::AllowsDumps() {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabase::AllowsDumps"); FAILED(hr))
        return hr;
    return dumps_ ? S_OK : S_FALSE;
}

HRESULT ActiveDatabase::SetAllowsDumps(BOOL allow) {
    dumps_ = allow != FALSE;
    return S_OK;
}

ActiveDatabase::Advised* ActiveDatabase::Find(IGWObjectEventSink* sink) {
    auto at = std::find_if(sinks_.begin(), sinks_.end(),
                           [&](const Advised& one) { return one.sink.Get() == sink; });
    return at == sinks_.end() ? nullptr : &*at;
}

HRESULT ActiveDatabase::Enter(IGWObjectEventSink* sink, Advised** entry) {
    if (!sink)
        return E_POINTER;
    return ut::ExportBoundary([&] {
        *entry = Find(sink);
        if (!*entry)
            *entry = &sinks_.emplace_back(Advised{ut::ComPtr<IGWObjectEventSink>(sink)});
        return S_OK;
    });
}

HRESULT ActiveDatabase::Advise(IGWObjectEventSink* sink, ULONG mask) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabaseNotifier::Advise"); FAILED(hr))
        return hr;
    Advised* entry = nullptr;
    if (HRESULT hr = Enter(sink, &entry); FAILED(hr))
        return hr;
    entry->mask = mask;
    return S_OK;
}

HRESULT ActiveDatabase::AdviseFinalEndLoad(IGWObjectEventSink* sink, ULONG cookie) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabaseNotifier::AdviseFinalEndLoad"); FAILED(hr))
        return hr;
    Advised* entry = nullptr;
    if (HRESULT hr = Enter(sink, &entry); FAILED(hr))
        return hr;
    entry->finalEndLoad = true;
    entry->cookie = cookie;
    return S_OK;
}

HRESULT ActiveDatabase::Unadvise(IGWObjectEventSink* sink) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWActiveDatabaseNotifier::Unadvise"); FAILED(hr))
        return hr;
    Advised* entry = Find(sink);
    if (!entry)
        return S_FALSE;
    sinks_.erase(sinks_.begin() + (entry - sinks_.data()));
    return S_OK;
}

HRESULT ActiveDatabase::Fire(ULONG event, IUnknown* object) {
    // A sink may withdraw while it is told: the ones to tell are taken first.
    std::vector<Advised> told;
    HRESULT copied = ut::ExportBoundary([&] {
        for (const Advised& one : sinks_)
            if ((one.mask & event) || (event == GWDB_EVENT_LOAD_SAVE && one.finalEndLoad))
                told.push_back(one);
        return S_OK;
    });
    if (FAILED(copied))
        return copied;
    for (const Advised& one : told) {
        IGWObjectEventSink& sink = *one.sink;
        switch (event) {
        case GWDB_EVENT_ADDED:
            (void)sink.OnObjectAdded(object); // what a sink answers is not looked at
            break;
        case GWDB_EVENT_REMOVED:
            (void)sink.OnObjectRemoved(object);
            break;
        case GWDB_EVENT_ID_CHANGED:
            (void)sink.OnObjectIDChanged(object);
            break;
        default:
            if (one.mask & event)
                (void)sink.OnEndLoad();
            if (one.finalEndLoad)
                (void)sink.OnFinalEndLoad(one.cookie);
        }
    }
    return told.empty() ? S_FALSE : S_OK;
}

} // namespace ut::host
