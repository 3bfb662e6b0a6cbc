// Views: the host's view manager, which knows every view class by its identifier and its name.
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

// {33676D80-F4E9-4106-8C5D-35FAF7178ED4} (the reference host's; an application installs its own
// manager under this class)
inline constexpr CLSID CLSID_GWViewManager = {
    0x33676D80, 0xF4E9, 0x4106, {0x8C, 0x5D, 0x35, 0xFA, 0xF7, 0x17, 0x8E, 0xD4}};
// {33676D81-F4E9-4106-8C5D-35FAF7178ED4}
inline constexpr IID IID_IGWViewManager = {
    0x33676D81, 0xF4E9, 0x4106, {0x8C, 0x5D, 0x35, 0xFA, 0xF7, 0x17, 0x8E, 0xD4}};

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

template <>
struct ut::InterfaceId<IGWViewManager> : ut::Iid<IID_IGWViewManager> {};

// The application's view manager (found through GWQueryGenericObject).
UT_SDK_API HRESULT GWGetViewMgr(IGWViewManager** manager);

// The view manager's GetViewName: the name of view class `clsid` into `name` of `capacity`
// characters. A manager that cannot be had answers its failure.
UT_SDK_API HRESULT GWFindViewNameFromCLSID(REFCLSID clsid, wchar_t* name, int capacity);
