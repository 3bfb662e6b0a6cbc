// The scene defaults: per class, the object and the stream that new objects of the class take
// their values from, and the creation of an object from them.
#pragma once

#include <ut/platform/com.h>
#include <ut/platform/stream.h>
#include <ut/sdk/presets.h>

// {CE38DE41-5C05-11D4-B4A2-00D0B71903E4}: its key in the content container.
inline constexpr GUID GUID_3DSceneDefaultsKey = {
    0xCE38DE41, 0x5C05, 0x11D4, {0xB4, 0xA2, 0x00, 0xD0, 0xB7, 0x19, 0x03, 0xE4}};
// {9C6B4C11-5E81-11D4-B4A2-00D0B71903E4}
inline constexpr IID IID_I3DSceneDefaults = {
    0x9C6B4C11, 0x5E81, 0x11D4, {0xB4, 0xA2, 0x00, 0xD0, 0xB7, 0x19, 0x03, 0xE4}};

// Outputs are cleared first; a null one answers E_POINTER.
struct I3DSceneDefaults : IUnknown {
    // The default object of class `clsid` (the same one on every call).
    virtual HRESULT STDMETHODCALLTYPE GetObjectForClass(GUID clsid, IUnknown** object) = 0;
    // The stream holding the defaults of class `clsid`, positioned at its start.
    virtual HRESULT STDMETHODCALLTYPE GetStreamForClass(GUID clsid, IStream** stream) = 0;
    // A new object of class `clsid` through `iid`, set up from the defaults, then from `preset`
    // when that is not null.
    virtual HRESULT STDMETHODCALLTYPE CreateDefaultInstance(REFCLSID clsid, REFIID iid, void** object,
                                                            IGWPreset* preset) = 0;

protected:
    ~I3DSceneDefaults() = default;
};

template <>
struct ut::InterfaceId<I3DSceneDefaults> : ut::Iid<IID_I3DSceneDefaults> {};
