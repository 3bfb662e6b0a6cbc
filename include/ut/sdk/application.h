// The application object (its state flags, saving and loading state, and the mode test that
// lets diagnostic dumps run) and the plug-in registry with its items. The application object is
// the active database of ut/sdk/database.h, reached by the same class and interface: its
// interface extends that one.
//
// The reference host's application starts with every flag 0, saving and loading states 0 and
// dumps refused; a test or a tool sets them through the same interface. Its plug-in registry
// starts empty. Every operation asks ut::sdk::CheckHostFault first, under
// "IGWApplication::<method>" and "IKXPluginRegistry::<method>".
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/database.h>
#include <ut/sdk/export.h>

inline constexpr const CLSID& CLSID_GWApplication = CLSID_GWActiveDatabase;
inline constexpr const IID& IID_IGWApplication = IID_IGWActiveDatabase;
// {6A73598B-2FBD-40A1-A7B8-1870FD3E46F2}
inline constexpr CLSID CLSID_KXPluginRegistry = {
    0x6A73598B, 0x2FBD, 0x40A1, {0xA7, 0xB8, 0x18, 0x70, 0xFD, 0x3E, 0x46, 0xF2}};
// {A869C8C7-C89A-4D7A-8355-CE3AD1308136}
inline constexpr IID IID_IKXPluginRegistry = {
    0xA869C8C7, 0xC89A, 0x4D7A, {0x83, 0x55, 0xCE, 0x3A, 0xD1, 0x30, 0x81, 0x36}};
// {6A73598C-2FBD-40A1-A7B8-1870FD3E46F2}
inline constexpr IID IID_IKXPluginItem = {
    0x6A73598C, 0x2FBD, 0x40A1, {0xA7, 0xB8, 0x18, 0x70, 0xFD, 0x3E, 0x46, 0xF2}};

enum GWSaveType : LONG { GWSAVE_NONE = 0, GWSAVE_SAVING = 1, GWSAVE_AUTOSAVE = 2 };
enum GWLoadType : LONG { GWLOAD_NONE = 0, GWLOAD_LOADING = 1, GWLOAD_NORECOVERY = 6 };

// The state flag that says the application has finished starting.
inline constexpr ULONG GWAPP_STATE_STARTED = 8;

struct IGWApplication : IGWActiveDatabase {
    // The value of state flag `flag`; E_INVALIDARG past flag 31.
    virtual HRESULT STDMETHODCALLTYPE GetStateFlag(ULONG flag, LONG* value) = 0;
    virtual HRESULT STDMETHODCALLTYPE SetStateFlag(ULONG flag, LONG value) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetSavingState(GWSaveType* save, GWLoadType* load) = 0;
    virtual HRESULT STDMETHODCALLTYPE SetSavingState(GWSaveType save, GWLoadType load) = 0;
    // S_OK when the application's mode lets diagnostic dumps run, S_FALSE when not.
    virtual HRESULT STDMETHODCALLTYPE AllowsDumps() = 0;
    virtual HRESULT STDMETHODCALLTYPE SetAllowsDumps(BOOL allow) = 0;

protected:
    ~IGWApplication() = default;
};

struct IKXPluginItem : IUnknown {
    // The item's name, task-allocated, and its kind.
    virtual HRESULT STDMETHODCALLTYPE GetName(wchar_t** name) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetKind(GUID* kind) = 0;

protected:
    ~IKXPluginItem() = default;
};

struct IKXPluginRegistry : IUnknown {
    // The item of `kind` named `name` (letter case ignored): S_OK with the item, S_FALSE with
    // null when there is none. `reserved` must be 0 (E_INVALIDARG).
    virtual HRESULT STDMETHODCALLTYPE GetItem(ULONG reserved, REFGUID kind, const wchar_t* name,
                                              IKXPluginItem** item) = 0;
    // Registers an item; S_FALSE when one of that kind and name is there already.
    virtual HRESULT STDMETHODCALLTYPE AddItem(REFGUID kind, const wchar_t* name) = 0;

protected:
    ~IKXPluginRegistry() = default;
};

template <>
struct ut::InterfaceId<IGWApplication> : ut::Iid<IID_IGWActiveDatabase> {};
template <>
struct ut::InterfaceId<IKXPluginItem> : ut::Iid<IID_IKXPluginItem> {};
template <>
struct ut::InterfaceId<IKXPluginRegistry> : ut::Iid<IID_IKXPluginRegistry> {};

// The application's saving and loading state; both cleared first. E_POINTER for a null argument.
UT_SDK_API HRESULT KXGetCurrentGWSavingState(GWSaveType* save, GWLoadType* load);
