// Views: the host's view manager, which knows every view class by its identifier and its name,
// and the factory of the controllers that drive a viewer.
//
// The reference host's views are the classes that modules registered in their "View" category:
// the keys HKEY_LOCAL_MACHINE "Software\ut\Modules\<module>\View\<identifier text>", each with
// the view's name as its "Name" value. When two modules register one class, the first module in
// the registry's order names it. Names compare without regard to case.
//
// Every operation asks ut::sdk::CheckHostFault first, under "IGWViewManager::<method>".
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// {1E9E95BB-B8CE-11CF-AE56-00A02411DF1A}
inline constexpr CLSID CLSID_GWViewManager = {
    0x1E9E95BB, 0xB8CE, 0x11CF, {0xAE, 0x56, 0x00, 0xA0, 0x24, 0x11, 0xDF, 0x1A}};
// {739FED21-C2E2-11CF-AE66-83AAE74B4CCC}
inline constexpr IID IID_IGWViewManager = {
    0x739FED21, 0xC2E2, 0x11CF, {0xAE, 0x66, 0x83, 0xAA, 0xE7, 0x4B, 0x4C, 0xCC}};
// {62338901-BA7C-11D0-B182-0800360BFF02}
inline constexpr CLSID CLSID_GWViewerControllerFactory = {
    0x62338901, 0xBA7C, 0x11D0, {0xB1, 0x82, 0x08, 0x00, 0x36, 0x0B, 0xFF, 0x02}};
// {5A338503-BA7C-11D0-B182-0800360BFF02}
inline constexpr IID IID_IGWViewerControllerFactory = {
    0x5A338503, 0xBA7C, 0x11D0, {0xB1, 0x82, 0x08, 0x00, 0x36, 0x0B, 0xFF, 0x02}};
// {1F123812-A557-4438-94AD-CFB98B0B595D} (not fixed by the application; the one this SDK declares)
inline constexpr IID IID_IGWViewerController = {
    0x1F123812, 0xA557, 0x4438, {0x94, 0xAD, 0xCF, 0xB9, 0x8B, 0x0B, 0x59, 0x5D}};

struct IGWViewManager : IUnknown {
    // Writes the name of the view class `view` into `name` (`capacity` characters, terminator
    // included). HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND) for a class that is not a view, and
    // HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER) when the name does not fit; the buffer is then
    // empty. E_POINTER for a null buffer, E_INVALIDARG for a zero capacity.
    virtual HRESULT STDMETHODCALLTYPE GetViewName(REFCLSID view, wchar_t* name, ULONG capacity) = 0;
    // The class of the view named `name`; HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND) with GUID_NULL
    // for a name no view has. E_POINTER for a null argument.
    virtual HRESULT STDMETHODCALLTYPE GetViewClass(const wchar_t* name, CLSID* view) = 0;

protected:
    ~IGWViewManager() = default;
};

// What drives a viewer (its camera and navigation); handed out as it is.
struct IGWViewerController : IUnknown {
protected:
    ~IGWViewerController() = default;
};

struct IGWViewerControllerFactory : IUnknown {
    // A new viewer controller, through `iid`.
    virtual HRESULT STDMETHODCALLTYPE CreateController(REFIID iid, void** controller) = 0;

protected:
    ~IGWViewerControllerFactory() = default;
};

template <>
struct ut::InterfaceId<IGWViewManager> : ut::Iid<IID_IGWViewManager> {};
template <>
struct ut::InterfaceId<IGWViewerController> : ut::Iid<IID_IGWViewerController> {};
template <>
struct ut::InterfaceId<IGWViewerControllerFactory> : ut::Iid<IID_IGWViewerControllerFactory> {};

// The application's view manager (found through GWQueryGenericObject).
UT_SDK_API HRESULT GWGetViewMgr(IGWViewManager** manager);

// The view manager's GetViewName: the name of view class `clsid` into `name` of `capacity`
// characters. A manager that cannot be had answers its failure.
UT_SDK_API HRESULT GWFindViewNameFromCLSID(REFCLSID clsid, wchar_t* name, int capacity);
