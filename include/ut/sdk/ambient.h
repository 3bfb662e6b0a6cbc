// The application's ambient values: named settings of the current context, read and written by
// name ("referencing.importingdelta", "context.constructionmode", ...).
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// {5A7E0B10-2C41-4C1B-9E60-7D3A1B2C4E01} (the reference host's; an application installs its own
// manager under this class)
inline constexpr CLSID CLSID_GWAmbientValues = {
    0x5A7E0B10, 0x2C41, 0x4C1B, {0x9E, 0x60, 0x7D, 0x3A, 0x1B, 0x2C, 0x4E, 0x01}};
// {5A7E0B11-2C41-4C1B-9E60-7D3A1B2C4E01}
inline constexpr IID IID_IGWAmbientValues = {
    0x5A7E0B11, 0x2C41, 0x4C1B, {0x9E, 0x60, 0x7D, 0x3A, 0x1B, 0x2C, 0x4E, 0x01}};

struct IGWAmbientValues : IUnknown {
    // A name the manager does not hold answers DISP_E_MEMBERNOTFOUND and leaves *value as it was;
    // a null name or value answers E_POINTER. A value of the other kind converts (0 is false).
    virtual HRESULT STDMETHODCALLTYPE GetBool(const wchar_t* name, BOOL* value) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetInt(const wchar_t* name, LONG* value) = 0;
    // Creates the value when it is new.
    virtual HRESULT STDMETHODCALLTYPE SetBool(const wchar_t* name, BOOL value) = 0;
    virtual HRESULT STDMETHODCALLTYPE SetInt(const wchar_t* name, LONG value) = 0;

protected:
    ~IGWAmbientValues() = default;
};

template <>
struct ut::InterfaceId<IGWAmbientValues> : ut::Iid<IID_IGWAmbientValues> {};

// The application's ambient values manager (found through GWQueryGenericObject).
UT_SDK_API HRESULT KXGetAmbientValuesMgr(IGWAmbientValues** manager);
