// The transient object container: the content container's collection of objects that live only
// while the scene is open and are never saved with it.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/components.h>

// {6F859231-71E7-11D3-B49F-00A0244EEB76}: its key in the content container.
inline constexpr GUID GUID_3DTransientObjectContainerKey = {
    0x6F859231, 0x71E7, 0x11D3, {0xB4, 0x9F, 0x00, 0xA0, 0x24, 0x4E, 0xEB, 0x76}};
// {7F2B78D0-7509-11D3-B4A0-005056E91DE4}
inline constexpr IID IID_I3DTransientObjectContainer = {
    0x7F2B78D0, 0x7509, 0x11D3, {0xB4, 0xA0, 0x00, 0x50, 0x56, 0xE9, 0x1D, 0xE4}};
// {FB607CD0-5207-11D0-854E-00A02417D029}: objects that answer it never count as transient, even
// when the container holds them.
inline constexpr IID IID_GWNotTransient = {
    0xFB607CD0, 0x5207, 0x11D0, {0x85, 0x4E, 0x00, 0xA0, 0x24, 0x17, 0xD0, 0x29}};

// Objects are told apart by identity (their IUnknown). E_POINTER for a null object.
struct I3DTransientObjectContainer : IUnknown {
    // Holds `object` (one reference); `flags` are kept with it. S_FALSE when it was held already.
    virtual HRESULT STDMETHODCALLTYPE Add(IGWComponentHierarchy* object, ULONG flags) = 0;
    // Lets `object` go; S_FALSE when it was not held.
    virtual HRESULT STDMETHODCALLTYPE Remove(IGWComponentHierarchy* object) = 0;
    // S_OK when `object` is held, S_FALSE when not.
    virtual HRESULT STDMETHODCALLTYPE Contains(IGWComponentHierarchy* object) = 0;
    // Lets every object go.
    virtual HRESULT STDMETHODCALLTYPE Reset() = 0;

protected:
    ~I3DTransientObjectContainer() = default;
};

template <>
struct ut::InterfaceId<I3DTransientObjectContainer> : ut::Iid<IID_I3DTransientObjectContainer> {};
