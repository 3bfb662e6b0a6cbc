// The reference host's active database, which is also its application object: the mode of its
// settings, its state flags (the database's masks and the application's numbered flags), the
// saving state, the dump mode, and the notifier that tells advised sinks of object events.
#pragma once

#include <array>
#include <vector>

#include <ut/host/reference_host.h>
#include <ut/sdk/application.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/database.h>

namespace ut::host {

class ActiveDatabase final : public ut::sdk::ComObject<IGWApplication, IGWActiveDatabaseNotifier> {
public:
    explicit ActiveDatabase(const Settings& settings) : mode_(settings.activeDatabaseMode) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetCurrentMode(ULONG* mode) override;
    HRESULT STDMETHODCALLTYPE SetStateFlags(ULONG flags, BOOL on) override;
    HRESULT STDMETHODCALLTYPE TestStateFlags(ULONG flags) override;

    HRESULT STDMETHODCALLTYPE GetStateFlag(ULONG flag, LONG* value) override;
    HRESULT STDMETHODCALLTYPE SetStateFlag(ULONG flag, LONG value) override;
    HRESULT STDMETHODCALLTYPE GetSavingState(GWSaveType* save, GWLoadType* load) override;
    HRESULT STDMETHODCALLTYPE SetSavingState(GWSaveType save, GWLoadType load) override;
    HRESULT STDMETHODCALLTYPE AllowsDumps() override;
    HRESULT STDMETHODCALLTYPE SetAllowsDumps(BOOL allow) override;

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
    std::array<LONG, 32> numberedFlags_{};
    GWSaveType save_ = GWSAVE_NONE;
    GWLoadType load_ = GWLOAD_NONE;
    bool dumps_ = false;
    std::vector<Advised> sinks_;
};

} // namespace ut::host
