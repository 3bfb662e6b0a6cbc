// The reference host's active database: the mode of its settings, its state flags, and the
// notifier that tells advised sinks of object events.
#pragma once

#include <vector>

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/database.h>

namespace ut::host {

class ActiveDatabase final : public ut::sdk::ComObject<IGWActiveDatabase, IGWActiveDatabaseNotifier> {
public:
    explicit ActiveDatabase(const Settings& settings) : mode_(settings.activeDatabaseMode) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetCurrentMode(ULONG* mode) override;
    HRESULT STDMETHODCALLTYPE SetStateFlags(ULONG flags, BOOL on) override;
    HRESULT STDMETHODCALLTYPE TestStateFlags(ULONG flags) override;

    HRESULT STDMETHODCALLTYPE Advise(IGWObjectEventSink* sink, ULONG mask) override;
    HRESULT STDMETHODCALLTYPE Unadvise(IGWObjectEventSink* sink) override;
    HRESULT STDMETHODCALLTYPE AdviseFinalEndLoad(IGWObjectEventSink* sink, ULONG cookie) override;
    HRESULT STDMETHODCALLTYPE Fire(ULONG event, IUnknown* object) override;

private:
    struct Advised {
        ut::ComPtr<IGWObjectEventSink> sink;
        ULONG mask = 0;
        bool finalEndLoad = false;
        ULONG cookie = 0;
    };
    Advised* Find(IGWObjectEventSink* sink);
    HRESULT Enter(IGWObjectEventSink* sink, Advised** entry);

    ULONG mode_;
    ULONG flags_ = 0;
    std::vector<Advised> sinks_;
};

} // namespace ut::host
