// Change notification sinks: CKXAppNotifySink turns the application's named notifications into
// typed handlers; the active-database helpers advise sinks of object events; the property
// notification forwarders; and C3DFCurveKeySelectionCache, the process-wide set of curves whose
// keys are selected.
//
// Decided here: states 1, 4, 16 and 256 of "GWAPP_STATE_CHANGE" go to OnStartup, OnNewProject,
// OnPostCloseProject and OnChangedProject. Advise and Unadvise stop at the first bit the service
// refuses and answer its failure; the bits stay as they were recorded before the service was asked.
// FPropertyAddedNotify and FPropertyRemovedNotify send GWPROPERTY_ADDED (1) and GWPROPERTY_REMOVED
// (3). A curve whose parent cannot say whether it is valid stays in the cache. The cache is made on
// first use and lives as long as the process.
#pragma once

#include <map>
#include <set>
#include <span>

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/curves.h>
#include <ut/sdk/database.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/variant.h>

// The notifications CKXAppNotifySink can be advised on, as bits of its flags.
inline constexpr unsigned long KXNOTIFY_APP_STATE = 1;    // "GWAPP_STATE_CHANGE"
inline constexpr unsigned long KXNOTIFY_SELECTION = 2;    // "KX3D_SELECTION_LIST"
inline constexpr unsigned long KXNOTIFY_ACTIVATION = 4;   // "DesktopAppActivation"
inline constexpr unsigned long KXNOTIFY_MINIMIZED = 8;    // "DesktopAppMinimized"
inline constexpr unsigned long KXNOTIFY_RESTORE = 16;     // "DesktopAppRestore"
inline constexpr unsigned long KXNOTIFY_ACTIVE_LIST = 32; // "KX3D_ACTIVE_LIST"

class UT_API CKXAppNotifySink : public CGWCOMObject, public IGwNotifySink {
public:
    CKXAppNotifySink() = default;

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override;
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    // Dispatches a notification by its exact name to the handler below; other names answer S_OK.
    HRESULT STDMETHODCALLTYPE PropertyChanged(const wchar_t* name, ULONG kind, const VARIANT* value,
                                              int reserved) override;
    // Each does nothing and answers S_OK here.
    virtual HRESULT OnTerminate();        // state 8
    virtual HRESULT OnPreCloseProject();  // state 2
    virtual HRESULT OnStartup();          // state 1
    virtual HRESULT OnNewProject();       // state 4
    virtual HRESULT OnPostCloseProject(); // state 16
    virtual HRESULT OnSelectionChange(ULONG kind, const VARIANT* value);
    virtual HRESULT OnActiveListChange(ULONG kind, const VARIANT* value);
    virtual HRESULT OnChangedProject(); // state 256
    virtual HRESULT OnActivate(bool active);
    virtual HRESULT OnMinimize();
    virtual HRESULT OnMaximize();

    // Advises the notifications of `flags` (KXNOTIFY_*): S_FALSE, doing nothing, when any of them
    // is advised already. Unadvise: S_FALSE, doing nothing, when any of them is not.
    HRESULT Advise(unsigned long flags);
    HRESULT Unadvise(unsigned long flags);
    unsigned long Flags() const { return flags_; }

protected:
    ~CKXAppNotifySink() override = default;

private:
    HRESULT Tell(unsigned long flags, bool advise);

    unsigned long flags_ = 0;
};

// Advises `sink`'s IGWObjectEventSink with the active database on the events of `mask` (after
// withdrawing it from everything), or only withdraws it when `advise` is zero.
UT_API HRESULT KXAdviseOnActiveDBEx(IUnknown* sink, int advise, unsigned long mask);
// The same with mask GWDB_EVENT_LOAD_SAVE (16).
UT_API HRESULT KXAdviseOnActiveDB(IUnknown* sink, int advise);
// Withdraws `sink` and registers it for the final end of load with `cookie`.
UT_API HRESULT KXAdviseOnActiveDBForFinalEndLoad(IUnknown* sink, unsigned long cookie);

// While one lives, loads resolve every reference as they go.
class UT_API CKXResolveAllDuringLoadHelper {
public:
    CKXResolveAllDuringLoadHelper();
    ~CKXResolveAllDuringLoadHelper();
    CKXResolveAllDuringLoadHelper(const CKXResolveAllDuringLoadHelper&) = delete;
    CKXResolveAllDuringLoadHelper& operator=(const CKXResolveAllDuringLoadHelper&) = delete;
};

// 1 when the last load was cancelled, else 0 (also when the database cannot say).
UT_API int F3DWasLoadCancelled();

// Send a property notification to `sinks` with GWPropertyNotify; with more than one sink, inside
// the scene manager's quiet bracket. The broadcast's result is returned.
UT_API HRESULT FPropertyChangedNotify(REFGUID property, const GWVARIANT* value, IUnknown* owner,
                                      const GWPARAMS* parameters, unsigned short first, unsigned short second,
                                      std::map<IGwPropertyNotifySink*, unsigned long>& sinks);
UT_API HRESULT FPropertyAddedNotify(REFGUID property, const GWVARIANT* value, IUnknown* owner,
                                    const GWPARAMS* parameters, unsigned short first, unsigned short second,
                                    std::map<IGwPropertyNotifySink*, unsigned long>& sinks);
UT_API HRESULT FPropertyRemovedNotify(REFGUID property, const GWVARIANT* value, IUnknown* owner,
                                      const GWPARAMS* parameters, unsigned short first, unsigned short second,
                                      std::map<IGwPropertyNotifySink*, unsigned long>& sinks);

// The curves whose keys are selected, by identity, one reference each. It listens to the
// application state and to object removal only from its first curve until it is cleared.
class UT_API C3DFCurveKeySelectionCache : public CKXAppNotifySink, public IGWObjectEventSink {
public:
    C3DFCurveKeySelectionCache() = default;

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override;
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    void AddCurve(IFCurve* curve);
    bool RemoveCurve(IFCurve* curve);
    bool IsCurveInCache(IFCurve* curve) const;
    // Drops the curve when its object is gone.
    void ValidateCurve(IFCurve* curve);
    void Clear();
    bool IsEmpty() const { return curves_.empty(); }
    void Reset();
    // The next curve (one reference), or null after the last.
    IFCurve* Next();

    HRESULT OnTerminate() override;
    HRESULT OnPreCloseProject() override;

    HRESULT STDMETHODCALLTYPE OnObjectAdded(IUnknown*) override { return S_OK; }
    HRESULT STDMETHODCALLTYPE OnObjectRemoved(IUnknown* object) override;
    HRESULT STDMETHODCALLTYPE OnObjectIDChanged(IUnknown*) override { return S_OK; }
    HRESULT STDMETHODCALLTYPE OnBeginLoad() override { return S_OK; }
    HRESULT STDMETHODCALLTYPE OnBeginSave() override { return S_OK; }
    HRESULT STDMETHODCALLTYPE OnEndLoad() override { return S_OK; }
    HRESULT STDMETHODCALLTYPE OnEndSave() override { return S_OK; }
    HRESULT STDMETHODCALLTYPE OnFinalEndLoad(ULONG) override { return S_OK; }

    bool Listening() const { return listening_; }

protected:
    ~C3DFCurveKeySelectionCache() override;

private:
    // Drops the entry of identity `identity`; true when there was one.
    bool Drop(IUnknown* identity);

    std::set<IUnknown*> curves_;
    std::set<IUnknown*>::iterator cursor_ = curves_.end();
    bool listening_ = false;
};

// The process's one cache, made on first call.
UT_API C3DFCurveKeySelectionCache* KXGetFCurveKeySelectionCache();
