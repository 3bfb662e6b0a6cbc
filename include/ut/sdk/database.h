// The application's active database: the object that owns the scene being edited.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// {B54DCA74-E452-11D1-8873-00A024EE6238}
inline constexpr CLSID CLSID_GWActiveDatabase = {
    0xB54DCA74, 0xE452, 0x11D1, {0x88, 0x73, 0x00, 0xA0, 0x24, 0xEE, 0x62, 0x38}};
// {B54DCA75-E452-11D1-8873-00A024EE6238}
inline constexpr IID IID_IGWActiveDatabase = {
    0xB54DCA75, 0xE452, 0x11D1, {0x88, 0x73, 0x00, 0xA0, 0x24, 0xEE, 0x62, 0x38}};

struct IGWActiveDatabase : IUnknown {
    // The database mode the application currently works in.
    virtual HRESULT STDMETHODCALLTYPE GetCurrentMode(ULONG* mode) = 0;

protected:
    ~IGWActiveDatabase() = default;
};

template <>
struct ut::InterfaceId<IGWActiveDatabase> : ut::Iid<IID_IGWActiveDatabase> {};
