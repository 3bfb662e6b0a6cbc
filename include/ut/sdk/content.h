// The application's content containers (the roots of scenes), their properties and the
// parameters of a property, and the request record that says who changes a value.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>
#include <ut/sdk/variant.h>

// {46F7B210-C532-11D2-B924-00A024C78EE3}: the creatable content container.
inline constexpr CLSID CLSID_GWContentContainer = {
    0x46F7B210, 0xC532, 0x11D2, {0xB9, 0x24, 0x00, 0xA0, 0x24, 0xC7, 0x8E, 0xE3}};
// {CDCA9820-C753-11D2-B926-00A024C78EE3}
inline constexpr IID IID_IGWContentContainer = {
    0xCDCA9820, 0xC753, 0x11D2, {0xB9, 0x26, 0x00, 0xA0, 0x24, 0xC7, 0x8E, 0xE3}};
// {2BABED40-B813-11CF-B646-00A024191AE0}
inline constexpr IID IID_IGWProperty = {
    0x2BABED40, 0xB813, 0x11CF, {0xB6, 0x46, 0x00, 0xA0, 0x24, 0x19, 0x1A, 0xE0}};
// {616F8769-1A7E-46D4-B30B-584B97FDA0B2}
inline constexpr IID IID_IGWParameter = {
    0x616F8769, 0x1A7E, 0x46D4, {0xB3, 0x0B, 0x58, 0x4B, 0x97, 0xFD, 0xA0, 0xB2}};

// {25571B20-CB95-11D2-88C8-00A024EE6238}: a container's key-time property.
inline constexpr GUID GUID_GWKeyTimeProperty = {
    0x25571B20, 0xCB95, 0x11D2, {0x88, 0xC8, 0x00, 0xA0, 0x24, 0xEE, 0x62, 0x38}};
// {B20A80FB-FF66-11D3-B7DD-0008C7A011A6}: the value parameter of a property (for the key time,
// a frame count as VT_R8).
inline constexpr GUID GUID_GWValueParameter = {
    0xB20A80FB, 0xFF66, 0x11D3, {0xB7, 0xDD, 0x00, 0x08, 0xC7, 0xA0, 0x11, 0xA6}};

// Who asks for a change; the host keeps it with the change (for undo and notification).
struct tagGWREQUEST {
    ULONG kind;
};
// A change a plug-in makes on the user's behalf.
inline constexpr ULONG GWREQUEST_PLUGIN = 18;

struct IGWParameter : IUnknown {
    // Copies the value into `value` (initialised by the caller, who clears it).
    virtual HRESULT STDMETHODCALLTYPE GetParamValue(GWVARIANT* value) = 0;
    // Sets the value; DISP_E_TYPEMISMATCH for a type the parameter does not hold.
    virtual HRESULT STDMETHODCALLTYPE SetParamValue(const tagGWREQUEST* request, const GWVARIANT* value) = 0;

protected:
    ~IGWParameter() = default;
};

struct IGWProperty : IUnknown {
    // Copies parameter `id` into `value` (initialised by the caller, who clears it);
    // DISP_E_MEMBERNOTFOUND for a parameter the property does not have.
    virtual HRESULT STDMETHODCALLTYPE GetParameterValue(REFGUID id, GWVARIANT* value) = 0;
    // Sets the property's value parameter, as IGWParameter::SetParamValue does.
    virtual HRESULT STDMETHODCALLTYPE SetValue(const tagGWREQUEST* request, const GWVARIANT* value) = 0;
    // Tells the application that the property changed; `redraw` also redraws the views showing it.
    // The last two arguments are reserved (0).
    virtual HRESULT STDMETHODCALLTYPE Refresh(const tagGWREQUEST* request, BOOL redraw, LONG reserved1,
                                              LONG reserved2) = 0;

protected:
    ~IGWProperty() = default;
};

struct IGWContentContainer : IUnknown {
    // The container's property `id` through `iid`; DISP_E_MEMBERNOTFOUND when it has none.
    virtual HRESULT STDMETHODCALLTYPE FindProperty(REFGUID id, REFIID iid, void** property) = 0;

protected:
    ~IGWContentContainer() = default;
};

template <>
struct ut::InterfaceId<IGWParameter> : ut::Iid<IID_IGWParameter> {};
template <>
struct ut::InterfaceId<IGWProperty> : ut::Iid<IID_IGWProperty> {};
template <>
struct ut::InterfaceId<IGWContentContainer> : ut::Iid<IID_IGWContentContainer> {};

// The container the user works in, through `iid`. E_FAIL when none is current.
UT_SDK_API HRESULT GWContentGetCurrentContainer(REFIID iid, void** container);
// Makes `container` current (the application does, when a scene opens); null leaves none current.
UT_SDK_API HRESULT GWContentSetCurrentContainer(IUnknown* container);
