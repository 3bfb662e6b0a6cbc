// The application's content containers (the roots of scenes), the current one, and the objects a
// container keeps under fixed keys: the key time, the cache manager, the reference-plane folder
// and the device manager (the transient object container and the scene defaults have headers of
// their own).
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>
#include <ut/sdk/properties.h>

// {46F7B210-C532-11D2-B924-00A024C78EE3}: the creatable content container.
inline constexpr CLSID CLSID_GWContentContainer = {
    0x46F7B210, 0xC532, 0x11D2, {0xB9, 0x24, 0x00, 0xA0, 0x24, 0xC7, 0x8E, 0xE3}};
// {CDCA9820-C753-11D2-B926-00A024C78EE3}
inline constexpr IID IID_IGWContentContainer = {
    0xCDCA9820, 0xC753, 0x11D2, {0xB9, 0x26, 0x00, 0xA0, 0x24, 0xC7, 0x8E, 0xE3}};

// {25571B20-CB95-11D2-88C8-00A024EE6238}: the key time, a property set whose value parameter
// counts frames.
inline constexpr GUID GUID_GWKeyTimeProperty = {
    0x25571B20, 0xCB95, 0x11D2, {0x88, 0xC8, 0x00, 0xA0, 0x24, 0xEE, 0x62, 0x38}};
// {6D81DA53-61DF-11D1-83C1-00A0243E268D}: the cache manager.
inline constexpr GUID GUID_3DCacheManagerKey = {
    0x6D81DA53, 0x61DF, 0x11D1, {0x83, 0xC1, 0x00, 0xA0, 0x24, 0x3E, 0x26, 0x8D}};
// {6D81DA54-61DF-11D1-83C1-00A0243E268D}
inline constexpr IID IID_I3DCacheMgr = {
    0x6D81DA54, 0x61DF, 0x11D1, {0x83, 0xC1, 0x00, 0xA0, 0x24, 0x3E, 0x26, 0x8D}};
// {8FB0A8D8-2AA2-11D4-B6A3-006094EB029C}: the reference-plane folder.
inline constexpr GUID GUID_3DRefPlaneFolderKey = {
    0x8FB0A8D8, 0x2AA2, 0x11D4, {0xB6, 0xA3, 0x00, 0x60, 0x94, 0xEB, 0x02, 0x9C}};
// {964B2365-5827-11D4-B7F6-0008C7A011A6}
inline constexpr IID IID_I3DRefPlaneFolder = {
    0x964B2365, 0x5827, 0x11D4, {0xB7, 0xF6, 0x00, 0x08, 0xC7, 0xA0, 0x11, 0xA6}};
// {74895A03-F74D-11D0-96C5-00A024191BAC}: the device manager (asked for under the caller's
// interface).
inline constexpr GUID GUID_3DDeviceManagerKey = {
    0x74895A03, 0xF74D, 0x11D0, {0x96, 0xC5, 0x00, 0xA0, 0x24, 0x19, 0x1B, 0xAC}};

struct IGWContentContainer : IUnknown {
    // The object the container keeps under `key`, through `iid`; DISP_E_MEMBERNOTFOUND when it
    // keeps none.
    virtual HRESULT STDMETHODCALLTYPE FindObject(REFGUID key, REFIID iid, void** object) = 0;

protected:
    ~IGWContentContainer() = default;
};

// The caches of computed scene data. Its operations belong to the features that use it; the
// library only hands it out.
struct I3DCacheMgr : IUnknown {
protected:
    ~I3DCacheMgr() = default;
};

// The folder of the scene's reference planes; handed out as it is.
struct I3DRefPlaneFolder : IUnknown {
protected:
    ~I3DRefPlaneFolder() = default;
};

template <>
struct ut::InterfaceId<IGWContentContainer> : ut::Iid<IID_IGWContentContainer> {};
template <>
struct ut::InterfaceId<I3DCacheMgr> : ut::Iid<IID_I3DCacheMgr> {};
template <>
struct ut::InterfaceId<I3DRefPlaneFolder> : ut::Iid<IID_I3DRefPlaneFolder> {};

// The container the user works in, through `iid`. E_FAIL when none is current.
UT_SDK_API HRESULT GWContentGetCurrentContainer(REFIID iid, void** container);
// Makes `container` current (the application does, when a scene opens); null leaves none current.
UT_SDK_API HRESULT GWContentSetCurrentContainer(IUnknown* container);
