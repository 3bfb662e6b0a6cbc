// The application's active database: the object that owns the scene being edited, its state
// flags, and its notifier, which tells advised sinks of the objects added to and removed from it.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// {B54DCA74-E452-11D1-8873-00A024EE6238}
inline constexpr CLSID CLSID_GWActiveDatabase = {
    0xB54DCA74, 0xE452, 0x11D1, {0x88, 0x73, 0x00, 0xA0, 0x24, 0xEE, 0x62, 0x38}};
// {B54DCA75-E452-11D1-8873-00A024EE6238}
inline constexpr IID IID_IGWActiveDatabase = {
    0xB54DCA75, 0xE452, 0x11D1, {0x88, 0x73, 0x00, 0xA0, 0x24, 0xEE, 0x62, 0x38}};

// {339597E5-92FF-11D3-B4AF-005056F0B923}: the notifier, asked of the same object.
inline constexpr IID IID_IGWActiveDatabaseNotifier = {
    0x339597E5, 0x92FF, 0x11D3, {0xB4, 0xAF, 0x00, 0x50, 0x56, 0xF0, 0xB9, 0x23}};
// {37A78C21-93A1-11D3-B4AF-005056F0B923}
inline constexpr IID IID_IGWObjectEventSink = {
    0x37A78C21, 0x93A1, 0x11D3, {0xB4, 0xAF, 0x00, 0x50, 0x56, 0xF0, 0xB9, 0x23}};

// The state flags of the database. Loads resolve every reference as they go while both resolve
// flags are set.
inline constexpr ULONG GWDB_STATE_RESOLVE_ALL = 1;
inline constexpr ULONG GWDB_STATE_RESOLVE_DURING_LOAD = 2;
inline constexpr ULONG GWDB_STATE_LOAD_CANCELLED = 4;

// The events of the database, as masks of what a sink is advised on.
inline constexpr ULONG GWDB_EVENT_ADDED = 1;
inline constexpr ULONG GWDB_EVENT_REMOVED = 2;
inline constexpr ULONG GWDB_EVENT_ID_CHANGED = 4;
inline constexpr ULONG GWDB_EVENT_LOAD_SAVE = 16;

struct IGWActiveDatabase : IUnknown {
    // The database mode the application currently works in.
    virtual HRESULT STDMETHODCALLTYPE GetCurrentMode(ULONG* mode) = 0;
    // Sets (`on` non-zero) or clears the GWDB_STATE_* flags of `flags`.
    virtual HRESULT STDMETHODCALLTYPE SetStateFlags(ULONG flags, BOOL on) = 0;
    // S_OK when every flag of `flags` is set, S_FALSE when not.
    virtual HRESULT STDMETHODCALLTYPE TestStateFlags(ULONG flags) = 0;

protected:
    ~IGWActiveDatabase() = default;
};

// Told of the database's events; what it answers is not looked at.
struct IGWObjectEventSink : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE OnObjectAdded(IUnknown* object) = 0;
    virtual HRESULT STDMETHODCALLTYPE OnObjectRemoved(IUnknown* object) = 0;
    virtual HRESULT STDMETHODCALLTYPE OnObjectIDChanged(IUnknown* object) = 0;
    virtual HRESULT STDMETHODCALLTYPE OnBeginLoad() = 0;
    virtual HRESULT STDMETHODCALLTYPE OnBeginSave() = 0;
    virtual HRESULT STDMETHODCALLTYPE OnEndLoad() = 0;
    virtual HRESULT STDMETHODCALLTYPE OnEndSave() = 0;
    // After the last of a series of loads; `cookie` is what the sink registered with.
    virtual HRESULT STDMETHODCALLTYPE OnFinalEndLoad(ULONG cookie) = 0;

protected:
    ~IGWObjectEventSink() = default;
};

// Sinks are held (one reference) while advised; a sink advised again has its mask replaced.
struct IGWActiveDatabaseNotifier : IUnknown {
    // Tells `sink` of the GWDB_EVENT_* events of `mask`. E_POINTER for a null sink.
    virtual HRESULT STDMETHODCALLTYPE Advise(IGWObjectEventSink* sink, ULONG mask) = 0;
    // Withdraws `sink` from every event and from the final end of load; S_FALSE when it was not
    // advised on anything.
    virtual HRESULT STDMETHODCALLTYPE Unadvise(IGWObjectEventSink* sink) = 0;
    // Tells `sink` of the final end of load, with `cookie`.
    virtual HRESULT STDMETHODCALLTYPE AdviseFinalEndLoad(IGWObjectEventSink* sink, ULONG cookie) = 0;
    // Tells the sinks advised on `event` (one GWDB_EVENT_* bit; GWDB_EVENT_LOAD_SAVE sends the
    // end of a load, then the final end of load) of `object`, in the order they were advised. The
    // application's own scene calls it; S_FALSE when no sink was told.
    virtual HRESULT STDMETHODCALLTYPE Fire(ULONG event, IUnknown* object) = 0;

protected:
    ~IGWActiveDatabaseNotifier() = default;
};

template <>
struct ut::InterfaceId<IGWActiveDatabase> : ut::Iid<IID_IGWActiveDatabase> {};
template <>
struct ut::InterfaceId<IGWObjectEventSink> : ut::Iid<IID_IGWObjectEventSink> {};
template <>
struct ut::InterfaceId<IGWActiveDatabaseNotifier> : ut::Iid<IID_IGWActiveDatabaseNotifier> {};
