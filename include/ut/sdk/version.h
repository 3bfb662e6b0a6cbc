// The application's version-information object: the strings that name the running build.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// {12A36560-3333-11D4-894D-00D0B71DA41F}
inline constexpr CLSID CLSID_GWVersionInfo = {
    0x12A36560, 0x3333, 0x11D4, {0x89, 0x4D, 0x00, 0xD0, 0xB7, 0x1D, 0xA4, 0x1F}};
// {12A36561-3333-11D4-894D-00D0B71DA41F}
inline constexpr IID IID_IGWVersionInfo = {
    0x12A36561, 0x3333, 0x11D4, {0x89, 0x4D, 0x00, 0xD0, 0xB7, 0x1D, 0xA4, 0x1F}};

// Index of the strings the object answers.
enum GWVersionString : ULONG {
    GWVERSION_PRODUCT = 0, // the product's name; absent when the host does not say who it is
    GWVERSION_BUILD = 1,   // the build number, four digits ("1109")
    GWVERSION_MAJOR = 2,   // the major version ("2000")
};

struct IGWVersionInfo : IUnknown {
    // Hands out a task-allocated copy of string `index` (freed with CoTaskMemFree). A string the
    // host does not have answers S_FALSE with *text null; a null `text` answers E_POINTER.
    virtual HRESULT STDMETHODCALLTYPE GetVersionString(ULONG index, wchar_t** text) = 0;

protected:
    ~IGWVersionInfo() = default;
};

template <>
struct ut::InterfaceId<IGWVersionInfo> : ut::Iid<IID_IGWVersionInfo> {};
