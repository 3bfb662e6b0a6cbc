// The application's named notifications: a sink interface that receives them, and the service
// that sinks advise by notification name and that broadcasts to them; and the property
// notifications that a property owner sends to its own sinks with GWPropertyNotify.
#pragma once

#include <map>
#include <optional>

#include <ut/platform/com.h>
#include <ut/platform/variant.h>
#include <ut/sdk/export.h>

// {A06DA230-7691-11CE-90A9-00AA006297D6}
inline constexpr IID IID_IGwNotifySink = {
    0xA06DA230, 0x7691, 0x11CE, {0x90, 0xA9, 0x00, 0xAA, 0x00, 0x62, 0x97, 0xD6}};
// {8B72A420-74CB-11CE-90A9-00AA006297D6}
inline constexpr CLSID CLSID_GWNotificationService = {
    0x8B72A420, 0x74CB, 0x11CE, {0x90, 0xA9, 0x00, 0xAA, 0x00, 0x62, 0x97, 0xD6}};
// {9AD72910-D69A-11CF-B64A-00A024191AE0}
inline constexpr IID IID_IGWNotificationService = {
    0x9AD72910, 0xD69A, 0x11CF, {0xB6, 0x4A, 0x00, 0xA0, 0x24, 0x19, 0x1A, 0xE0}};

// Receives the notifications it is advised on. Sinks that dispatch to typed handlers derive
// their own interface from this one and add the handlers after PropertyChanged.
struct IGwNotifySink : IUnknown {
    // `name` is the notification, `kind` and `value` what the sender passed; the last argument is
    // reserved and 0.
    virtual HRESULT STDMETHODCALLTYPE PropertyChanged(const wchar_t* name, ULONG kind, const VARIANT* value,
                                                      int reserved) = 0;

protected:
    ~IGwNotifySink() = default;
};

// Names are compared exactly (case-sensitive); sinks by their IGwNotifySink pointer, so that a
// sink whose QueryInterface hands out nothing can still be advised and withdrawn.
// Single-threaded, like the application's main thread that sends the notifications.
struct IGWNotificationService : IUnknown {
    // Holds one reference on `sink` until it is unadvised from `name`. Advising the same sink on
    // the same name again answers S_FALSE and keeps one registration. E_POINTER for a null name
    // or sink, E_INVALIDARG for an empty name.
    virtual HRESULT STDMETHODCALLTYPE Advise(const wchar_t* name, IGwNotifySink* sink) = 0;
    // S_FALSE when `sink` was not advised on `name`.
    virtual HRESULT STDMETHODCALLTYPE Unadvise(const wchar_t* name, IGwNotifySink* sink) = 0;
    // Calls PropertyChanged of every sink advised on `name`, in the order they were advised.
    // A sink may advise and unadvise sinks (itself included) from inside the call: a sink
    // unadvised during the broadcast is not called any more, one advised during it is called
    // from the next broadcast on. Every sink is told even when one fails; the answer is the
    // first failure, else S_OK, or S_FALSE when no sink is advised on `name`.
    virtual HRESULT STDMETHODCALLTYPE Broadcast(const wchar_t* name, ULONG kind, const VARIANT* value) = 0;

protected:
    ~IGWNotificationService() = default;
};

// {5B0E3F6C-7A52-4C4B-8E0D-2C6A4F1B9D31}
inline constexpr IID IID_IGwPropertyNotifySink = {
    0x5B0E3F6C, 0x7A52, 0x4C4B, {0x8E, 0x0D, 0x2C, 0x6A, 0x4F, 0x1B, 0x9D, 0x31}};

// The parameters a property notification is about; `ids` holds `count` parameter ids.
struct GWPARAMS {
    ULONG count;
    const GUID* ids;
};

// What happened to a property.
inline constexpr ULONG GWPROPERTY_ADDED = 1;
inline constexpr ULONG GWPROPERTY_CHANGED = 2;
inline constexpr ULONG GWPROPERTY_REMOVED = 3;

struct IGwPropertyNotifySink : IUnknown {
    // `kind` is a GWPROPERTY_*; the rest is what the sender passed on.
    virtual HRESULT STDMETHODCALLTYPE OnPropertyNotify(ULONG kind, REFGUID property, const VARIANT* value,
                                                       IUnknown* owner, const GWPARAMS* parameters,
                                                       USHORT first, USHORT second) = 0;

protected:
    ~IGwPropertyNotifySink() = default;
};

template <>
struct ut::InterfaceId<IGwNotifySink> : ut::Iid<IID_IGwNotifySink> {};
template <>
struct ut::InterfaceId<IGwPropertyNotifySink> : ut::Iid<IID_IGwPropertyNotifySink> {};
template <>
struct ut::InterfaceId<IGWNotificationService> : ut::Iid<IID_IGWNotificationService> {};

// Tells every sink of `sinks` whose mask (the value it is mapped to: bits 1 << kind, 0 for every
// kind) takes `kind`, in pointer order. Every sink is told even when one fails: the answer is the
// first failure, else S_OK, or S_FALSE when no sink was told.
UT_SDK_API HRESULT GWPropertyNotify(ULONG kind, REFGUID property, const VARIANT* value, IUnknown* owner,
                                    const GWPARAMS* parameters, USHORT first, USHORT second,
                                    std::map<IGwPropertyNotifySink*, unsigned long>& sinks);

namespace ut::sdk {

// The notification by which the application announces a change of its state, sent with kind
// kStateChangeKind and the new state as an integer payload.
inline constexpr wchar_t kAppStateChange[] = L"GWAPP_STATE_CHANGE";
inline constexpr ULONG kStateChangeKind = 1;
// The state the application announces when it terminates.
inline constexpr USHORT kAppStateTerminate = 8;

// The state a notification carries: the low 16 bits of a 16- or 32-bit integer payload (VT_I2,
// VT_UI2, VT_I4, VT_UI4, VT_INT, VT_UINT). Any other value, and a null one, carries no state.
inline std::optional<USHORT> NotificationState(const VARIANT* value) {
    if (!value)
        return std::nullopt;
    switch (value->vt) {
    case VT_I2:
    case VT_UI2:
        return static_cast<USHORT>(value->uiVal);
    case VT_I4:
    case VT_UI4:
    case VT_INT:
    case VT_UINT:
        return static_cast<USHORT>(value->ulVal & 0xFFFFu);
    default:
        return std::nullopt;
    }
}

} // namespace ut::sdk
