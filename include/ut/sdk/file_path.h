// The host's file-path object: a path as the user gave it, resolved by the application's path
// conventions, with the kind of path it is.
//
// The reference host's conventions: a text with a scheme ("name://...", two letters or more
// before the colon) is a linked path, used as given; a path from a root ("/", "\" or "X:") is
// absolute, used as given; any other is relative to the active project's folder (joined with
// "\"), or used as given when no project is active. Every operation asks
// ut::sdk::CheckHostFault first, under "IGWFilePath::<method>".
#pragma once

#include <ut/platform/com.h>

// {EFB641B1-75FE-11D3-B95D-00A024C78EE3}
inline constexpr CLSID CLSID_GWFilePath = {
    0xEFB641B1, 0x75FE, 0x11D3, {0xB9, 0x5D, 0x00, 0xA0, 0x24, 0xC7, 0x8E, 0xE3}};
// {EFB641B0-75FE-11D3-B95D-00A024C78EE3}
inline constexpr IID IID_IGWFilePath = {
    0xEFB641B0, 0x75FE, 0x11D3, {0xB9, 0x5D, 0x00, 0xA0, 0x24, 0xC7, 0x8E, 0xE3}};

enum tagEGWFilePathType : LONG {
    GWFILEPATH_ABSOLUTE = 0,
    GWFILEPATH_LINKED = 1, // not on the file system: nothing to test for access
    GWFILEPATH_PROJECT = 2,
};

struct IGWFilePath : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE SetPath(const wchar_t* path) = 0;
    // The resolved path, task-allocated. E_UNEXPECTED before SetPath.
    virtual HRESULT STDMETHODCALLTYPE GetResolvedPath(wchar_t** path) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetPathType(tagEGWFilePathType* type) = 0;

protected:
    ~IGWFilePath() = default;
};

template <>
struct ut::InterfaceId<IGWFilePath> : ut::Iid<IID_IGWFilePath> {};
