// Change notification sinks: the application sink's dispatch and advice, the active-database
// helpers, the property notification forwarders and the curve key-selection cache.
#include <cwchar>
#include <new>
#include <utility>

#include <ut/notify.h>
#include <ut/platform/detail/boundary.h>
#include <ut/scene.h>
#include <ut/sdk/objects.h>

namespace {

// The notifications by bit, in the order they are advised.
constexpr std::pair<unsigned long, const wchar_t*> kNotifications[] = {
    {KXNOTIFY_APP_STATE, L"GWAPP_STATE_CHANGE"},  {KXNOTIFY_SELECTION, L"KX3D_SELECTION_LIST"},
    {KXNOTIFY_ACTIVE_LIST, L"KX3D_ACTIVE_LIST"},  {KXNOTIFY_ACTIVATION, L"DesktopAppActivation"},
    {KXNOTIFY_MINIMIZED, L"DesktopAppMinimized"}, {KXNOTIFY_RESTORE, L"DesktopAppRestore"}};
// The notification kind that carries a state or an activation as an integer.
constexpr ULONG kIntegerKind = 1;
// The application states that have a handler of their own.
enum AppState : USHORT {
    kStartup = 1,
    kPreCloseProject = 2,
    kNewProject = 4,
    kTerminate = 8,
    kPostCloseProject = 16,
    kChangedProject = 256
};
// The events the curve cache listens to.
constexpr unsigned long kCurveEvents = GWDB_EVENT_REMOVED;

bool Is(const wchar_t* name, const wchar_t* notification) {
    return std::wcscmp(name, notification) == 0;
}

IUnknown* Identity(IUnknown* object) {
    IUnknown* identity = nullptr;
    if (object && FAILED(object->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&identity))))
        identity = nullptr;
    return identity;
}

template <class Interface>
HRESULT ActiveDatabase(ut::ComPtr<Interface>& database, REFIID iid) {
    return GWQueryGenericObject(CLSID_GWActiveDatabase, iid, database.PutVoid());
}

// Withdraws `sink` from the active database's notifier, then runs `then` on both.
template <class Then>
HRESULT WithEventSink(IUnknown* sink, Then then) {
    if (!sink)
        return E_POINTER;
    ut::ComPtr<IGWActiveDatabaseNotifier> notifier;
    if (HRESULT hr = ActiveDatabase(notifier, IID_IGWActiveDatabaseNotifier); FAILED(hr))
        return hr;
    ut::ComPtr<IGWObjectEventSink> events;
    if (HRESULT hr = sink->QueryInterface(IID_IGWObjectEventSink, events.PutVoid()); FAILED(hr))
        return hr;
    if (HRESULT hr = notifier->Unadvise(events.Get()); FAILED(hr))
        return hr;
    return then(*notifier, events.Get());
}

HRESULT Forward(ULONG kind, REFGUID property, const GWVARIANT* value, IUnknown* owner,
                const GWPARAMS* parameters, unsigned short first, unsigned short second,
                std::map<IGwPropertyNotifySink*, unsigned long>& sinks) {
    ut::ComPtr<I3DSceneManager> manager;
    bool bracket =
        sinks.size() > 1 && SUCCEEDED(KXGetSceneManager(IID_I3DSceneManager, manager.PutVoid(), 1));
    if (bracket)
        (void)manager->SetNotificationMode(GW3DNOTIFY_QUIET, 0); // the broadcast goes out either way
    HRESULT hr = GWPropertyNotify(kind, property, value, owner, parameters, first, second, sinks);
    if (bracket)
        (void)manager->SetNotificationMode(GW3DNOTIFY_NORMAL, 0); // as above
    return hr;
}

} // namespace

// The application sink.

HRESULT CKXAppNotifySink::QueryInterface(REFIID iid, void** object) {
    return CGWCOMObject::QueryInterface(iid, object);
}
ULONG CKXAppNotifySink::AddRef() {
    return CGWCOMObject::AddRef();
}
ULONG CKXAppNotifySink::Release() {
    return CGWCOMObject::Release();
}

std::span<const CGWCOMObject::InterfaceEntry> CKXAppNotifySink::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<CKXAppNotifySink, IGwNotifySink>(IID_IGwNotifySink)};
    return map;
}

HRESULT CKXAppNotifySink::PropertyChanged(const wchar_t* name, ULONG kind, const VARIANT* value, int) {
    if (!name)
        return S_OK;
    if (Is(name, L"GWAPP_STATE_CHANGE")) {
        if (kind != kIntegerKind || !value)
            return E_INVALIDARG;
        switch (ut::sdk::NotificationState(value).value_or(0)) {
        case kTerminate:
            return OnTerminate();
        case kPreCloseProject:
            return OnPreCloseProject();
        case kStartup:
            return OnStartup();
        case kNewProject:
            return OnNewProject();
        case kPostCloseProject:
            return OnPostCloseProject();
        case kChangedProject:
            return OnChangedProject();
        default:
            return S_OK;
        }
    }
    if (Is(name, L"KX3D_SELECTION_LIST"))
        return OnSelectionChange(kind, value);
    if (Is(name, L"KX3D_ACTIVE_LIST"))
        return OnActiveListChange(kind, value);
    if (Is(name, L"DesktopAppActivation")) {
        if (kind != kIntegerKind || !value)
            return E_INVALIDARG;
        return OnActivate(ut::sdk::NotificationState(value).value_or(0) != 0);
    }
    if (Is(name, L"DesktopAppMinimized"))
        return OnMinimize();
    if (Is(name, L"DesktopAppRestore"))
        return OnMaximize();
    return S_OK;
}

HRESULT CKXAppNotifySink::OnTerminate() {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnPreCloseProject() {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnStartup() {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnNewProject() {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnPostCloseProject() {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnSelectionChange(ULONG, const VARIANT*) {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnActiveListChange(ULONG, const VARIANT*) {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnChangedProject() {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnActivate(bool) {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnMinimize() {
    return S_OK;
}
HRESULT CKXAppNotifySink::OnMaximize() {
    return S_OK;
}

HRESULT CKXAppNotifySink::Advise(unsigned long flags) {
    if (flags & flags_)
        return S_FALSE; // all or nothing: one advised already means none is advised again
    flags_ |= flags;
    return Tell(flags, true);
}

HRESULT CKXAppNotifySink::Unadvise(unsigned long flags) {
    if ((flags & flags_) != flags)
        return S_FALSE;
    flags_ &= ~flags;
    return Tell(flags, false);
}

HRESULT CKXAppNotifySink::Tell(unsigned long flags, bool advise) {
    ut::ComPtr<IGWNotificationService> service;
    if (HRESULT hr =
            GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service.PutVoid());
        FAILED(hr))
        return hr;
    for (auto [bit, name] : kNotifications) {
        if (!(flags & bit))
            continue;
        HRESULT hr = advise ? service->Advise(name, this) : service->Unadvise(name, this);
        if (FAILED(hr))
            return hr;
    }
    return S_OK;
}

// The active database.

HRESULT KXAdviseOnActiveDBEx(IUnknown* sink, int advise, unsigned long mask) {
    return WithEventSink(sink, [&](IGWActiveDatabaseNotifier& notifier, IGWObjectEventSink* events) {
        return advise ? notifier.Advise(events, mask) : S_OK;
    });
}

HRESULT KXAdviseOnActiveDB(IUnknown* sink, int advise) {
    return KXAdviseOnActiveDBEx(sink, advise, GWDB_EVENT_LOAD_SAVE);
}

HRESULT KXAdviseOnActiveDBForFinalEndLoad(IUnknown* sink, unsigned long cookie) {
    return WithEventSink(sink, [&](IGWActiveDatabaseNotifier& notifier, IGWObjectEventSink* events) {
        return notifier.AdviseFinalEndLoad(events, cookie);
    });
}

CKXResolveAllDuringLoadHelper::CKXResolveAllDuringLoadHelper() {
    ut::ComPtr<IGWActiveDatabase> database;
    if (FAILED(ActiveDatabase(database, IID_IGWActiveDatabase)))
        return;
    (void)database->SetStateFlags(GWDB_STATE_RESOLVE_ALL, TRUE); // a load then resolves as it can
    (void)database->SetStateFlags(GWDB_STATE_RESOLVE_DURING_LOAD, TRUE);
}

CKXResolveAllDuringLoadHelper::~CKXResolveAllDuringLoadHelper() {
    ut::ComPtr<IGWActiveDatabase> database;
    if (SUCCEEDED(ActiveDatabase(database, IID_IGWActiveDatabase)))
        (void)database->SetStateFlags(GWDB_STATE_RESOLVE_ALL | GWDB_STATE_RESOLVE_DURING_LOAD,
                                      FALSE); // nothing more can be done in a destructor
}

int F3DWasLoadCancelled() {
    ut::ComPtr<IGWActiveDatabase> database;
    if (FAILED(ActiveDatabase(database, IID_IGWActiveDatabase)))
        return 0;
    return database->TestStateFlags(GWDB_STATE_LOAD_CANCELLED) == S_OK ? 1 : 0;
}

HRESULT FPropertyChangedNotify(REFGUID property, const GWVARIANT* value, IUnknown* owner,
                               const GWPARAMS* parameters, unsigned short first, unsigned short second,
                               std::map<IGwPropertyNotifySink*, unsigned long>& sinks) {
    return Forward(GWPROPERTY_CHANGED, property, value, owner, parameters, first, second, sinks);
}

HRESULT FPropertyAddedNotify(REFGUID property, const GWVARIANT* value, IUnknown* owner,
                             const GWPARAMS* parameters, unsigned short first, unsigned short second,
                             std::map<IGwPropertyNotifySink*, unsigned long>& sinks) {
    return Forward(GWPROPERTY_ADDED, property, value, owner, parameters, first, second, sinks);
}

HRESULT FPropertyRemovedNotify(REFGUID property, const GWVARIANT* value, IUnknown* owner,
                               const GWPARAMS* parameters, unsigned short first, unsigned short second,
                               std::map<IGwPropertyNotifySink*, unsigned long>& sinks) {
    return Forward(GWPROPERTY_REMOVED, property, value, owner, parameters, first, second, sinks);
}

// The curve key-selection cache.

HRESULT C3DFCurveKeySelectionCache::QueryInterface(REFIID iid, void** object) {
    return CGWCOMObject::QueryInterface(iid, object);
}
ULONG C3DFCurveKeySelectionCache::AddRef() {
    return CGWCOMObject::AddRef();
}
ULONG C3DFCurveKeySelectionCache::Release() {
    return CGWCOMObject::Release();
}

std::span<const CGWCOMObject::InterfaceEntry> C3DFCurveKeySelectionCache::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<C3DFCurveKeySelectionCache, IGwNotifySink>(IID_IGwNotifySink),
        ut::sdk::Entry<C3DFCurveKeySelectionCache, IGWObjectEventSink>(IID_IGWObjectEventSink)};
    return map;
}

C3DFCurveKeySelectionCache::~C3DFCurveKeySelectionCache() {
    for (IUnknown* curve : curves_)
        curve->Release();
}

void C3DFCurveKeySelectionCache::AddCurve(IFCurve* curve) {
    if (!curve)
        return;
    if (!listening_) {
        (void)Advise(KXNOTIFY_APP_STATE); // without it the cache is only emptied by hand
        (void)KXAdviseOnActiveDBEx(static_cast<IGwNotifySink*>(this), 1, kCurveEvents); // the same
        listening_ = true;
    }
    IUnknown* identity = Identity(curve);
    if (!identity)
        return;
    if (!ut::ExportBoundary([&] { return curves_.insert(identity).second; }, false))
        identity->Release(); // there already, or no room
}

bool C3DFCurveKeySelectionCache::Drop(IUnknown* identity) {
    auto at = curves_.find(identity);
    if (at == curves_.end())
        return false;
    if (cursor_ == at)
        ++cursor_;
    IUnknown* held = *at;
    curves_.erase(at);
    held->Release();
    return true;
}

bool C3DFCurveKeySelectionCache::RemoveCurve(IFCurve* curve) {
    ut::ComPtr<IUnknown> identity = ut::ComPtr<IUnknown>::Adopt(Identity(curve));
    return identity && Drop(identity.Get());
}

bool C3DFCurveKeySelectionCache::IsCurveInCache(IFCurve* curve) const {
    if (curves_.empty() || !curve)
        return false;
    ut::ComPtr<IUnknown> identity = ut::ComPtr<IUnknown>::Adopt(Identity(curve));
    return identity && curves_.count(identity.Get()) == 1;
}

void C3DFCurveKeySelectionCache::ValidateCurve(IFCurve* curve) {
    if (!IsCurveInCache(curve))
        return;
    ut::ComPtr<IUnknown> parent;
    if (FAILED(curve->GetParentObject(parent.Put())) || !parent) {
        RemoveCurve(curve);
        return;
    }
    ut::ComPtr<IGWValidObject> valid;
    if (SUCCEEDED(parent->QueryInterface(IID_IGWValidObject, valid.PutVoid())) && valid &&
        valid->IsValid() == S_FALSE)
        RemoveCurve(curve);
}

void C3DFCurveKeySelectionCache::Clear() {
    for (IUnknown* curve : curves_)
        curve->Release();
    curves_.clear();
    cursor_ = curves_.end();
    if (!listening_)
        return;
    (void)Unadvise(KXNOTIFY_APP_STATE); // a service that is gone has let go of the cache already
    (void)KXAdviseOnActiveDBEx(static_cast<IGwNotifySink*>(this), 0, kCurveEvents); // the same
    listening_ = false;
}

HRESULT C3DFCurveKeySelectionCache::OnTerminate() {
    Clear();
    return S_OK;
}

HRESULT C3DFCurveKeySelectionCache::OnPreCloseProject() {
    Clear();
    return S_OK;
}

HRESULT C3DFCurveKeySelectionCache::OnObjectRemoved(IUnknown* object) {
    ut::ComPtr<IUnknown> identity = ut::ComPtr<IUnknown>::Adopt(Identity(object));
    if (identity)
        (void)Drop(identity.Get()); // an object that was no curve of the cache
    return S_OK;
}

void C3DFCurveKeySelectionCache::Reset() {
    cursor_ = curves_.begin();
}

IFCurve* C3DFCurveKeySelectionCache::Next() {
    while (cursor_ != curves_.end()) {
        IFCurve* curve = nullptr;
        IUnknown* entry = *cursor_++;
        if (SUCCEEDED(entry->QueryInterface(IID_IFCurve, reinterpret_cast<void**>(&curve))) && curve)
            return curve;
    }
    return nullptr;
}

C3DFCurveKeySelectionCache* KXGetFCurveKeySelectionCache() {
    // Made once and never destroyed: the application reaches it until the process ends.
    static C3DFCurveKeySelectionCache* cache = new (std::nothrow) C3DFCurveKeySelectionCache;
    return cache;
}
