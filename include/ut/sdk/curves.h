// Function curves: the animation curve of a parameter, and the object it animates; and the test
// by which an object says whether it is still part of the scene.
#pragma once

#include <ut/platform/com.h>

// {01DFA2A0-6962-11CE-B8AC-00AA005C18EC}
inline constexpr IID IID_IFCurve = {
    0x01DFA2A0, 0x6962, 0x11CE, {0xB8, 0xAC, 0x00, 0xAA, 0x00, 0x5C, 0x18, 0xEC}};
// {4E7B7C0A-31F5-4F0E-A8F2-9C3E1D2B5A61}
inline constexpr IID IID_IGWValidObject = {
    0x4E7B7C0A, 0x31F5, 0x4F0E, {0xA8, 0xF2, 0x9C, 0x3E, 0x1D, 0x2B, 0x5A, 0x61}};

struct IFCurve : IUnknown {
    // The object whose parameter the curve animates (one reference); S_FALSE and null for a curve
    // that animates nothing.
    virtual HRESULT STDMETHODCALLTYPE GetParentObject(IUnknown** parent) = 0;

protected:
    ~IFCurve() = default;
};

struct IGWValidObject : IUnknown {
    // S_OK while the object is part of the scene, S_FALSE once it is not.
    virtual HRESULT STDMETHODCALLTYPE IsValid() = 0;

protected:
    ~IGWValidObject() = default;
};

template <>
struct ut::InterfaceId<IFCurve> : ut::Iid<IID_IFCurve> {};
template <>
struct ut::InterfaceId<IGWValidObject> : ut::Iid<IID_IGWValidObject> {};
