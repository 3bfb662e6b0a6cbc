// Preferences: the user's settings, read and written as text by name ("qvx_explorer.viewer", ...).
//
// The reference host keeps them in the registry, under HKEY_CURRENT_USER
// "Software\ut\Preferences", one REG_SZ value per preference named by it.
//
// Every operation asks ut::sdk::CheckHostFault first, under "IGWPreferences::<method>".
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// {BD37312E-A266-446A-95B9-EF19644432C2} (the reference host's; an application installs its own
// manager under this class)
inline constexpr CLSID CLSID_GWPreferences = {
    0xBD37312E, 0xA266, 0x446A, {0x95, 0xB9, 0xEF, 0x19, 0x64, 0x44, 0x32, 0xC2}};
// {BD37312F-A266-446A-95B9-EF19644432C2}
inline constexpr IID IID_IGWPreferences = {
    0xBD37312F, 0xA266, 0x446A, {0x95, 0xB9, 0xEF, 0x19, 0x64, 0x44, 0x32, 0xC2}};

struct IGWPreferences : IUnknown {
    // The text of the preference `name`, task-allocated (the caller frees it with CoTaskMemFree).
    // HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND) with a null text for a preference that was never
    // set, DISP_E_TYPEMISMATCH for one that is not text. E_POINTER for a null argument.
    virtual HRESULT STDMETHODCALLTYPE GetText(const wchar_t* name, wchar_t** text) = 0;
    // Sets the preference `name`, creating it when it is new. E_POINTER for a null argument.
    virtual HRESULT STDMETHODCALLTYPE SetText(const wchar_t* name, const wchar_t* text) = 0;

protected:
    ~IGWPreferences() = default;
};

template <>
struct ut::InterfaceId<IGWPreferences> : ut::Iid<IID_IGWPreferences> {};

// The application's preferences manager (found through GWQueryGenericObject).
UT_SDK_API HRESULT KXGetPreferencesMgr(IGWPreferences** manager);
