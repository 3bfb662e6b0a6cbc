// Shader networks: shader nodes, their ports and the connections between them, named objects and
// the name spaces they belong to.
//
// A shader node is a component hierarchy that answers at least one of IID_IGWShaderNode (an
// IGWComponentAccess), IGWShaderPorts and IGWShaderNodeEx. Its ports are read through IGWShaderPorts; a node
// without it has no ports. Ports nest: a port may have child ports, and siblings follow one another.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/components.h>

// {8C80DEE3-1064-11D3-B0B7-00A0C982A112}: the same id as IGWComponentAccess; every hierarchy
// whose components can be read counts as a shader node.
inline constexpr IID IID_IGWShaderNode = IID_IGWComponentAccess;
// {9D6C287C-333D-4086-B405-B26651E4C23F}
inline constexpr IID IID_IGWShaderPorts = {
    0x9D6C287C, 0x333D, 0x4086, {0xB4, 0x05, 0xB2, 0x66, 0x51, 0xE4, 0xC2, 0x3F}};
// {9C9BAEA6-4172-4478-9E14-561E1ED10CAB}
inline constexpr IID IID_IGWShaderNodeEx = {
    0x9C9BAEA6, 0x4172, 0x4478, {0x9E, 0x14, 0x56, 0x1E, 0x1E, 0xD1, 0x0C, 0xAB}};
// {D52B0CC5-243E-4180-9213-10285ECAEC3C}
inline constexpr IID IID_IGWShaderPortIndex = {
    0xD52B0CC5, 0x243E, 0x4180, {0x92, 0x13, 0x10, 0x28, 0x5E, 0xCA, 0xEC, 0x3C}};
// {AB9C2622-230D-11D2-8ED2-00A0248F947C}: marks a connected component that a walk of the network
// does not descend into.
inline constexpr IID IID_IGWShaderOpaque = {
    0xAB9C2622, 0x230D, 0x11D2, {0x8E, 0xD2, 0x00, 0xA0, 0x24, 0x8F, 0x94, 0x7C}};
// {9EE6DDB1-65CC-11D1-B0CE-00A024C79287}
inline constexpr IID IID_IGWNamedObject = {
    0x9EE6DDB1, 0x65CC, 0x11D1, {0xB0, 0xCE, 0x00, 0xA0, 0x24, 0xC7, 0x92, 0x87}};
// {2A41F2A4-0C1B-4D3C-9E5E-6F1D3E2B7A10}
inline constexpr IID IID_I3DGenericNameSpace = {
    0x2A41F2A4, 0x0C1B, 0x4D3C, {0x9E, 0x5E, 0x6F, 0x1D, 0x3E, 0x2B, 0x7A, 0x10}};

// A port of a node: six 32-bit words. `index` is the port's number on its node; the rest is the
// host's own addressing.
struct tagGWShaderPort {
    ULONG index;
    ULONG node;
    ULONG path[4];
};
static_assert(sizeof(tagGWShaderPort) == 24);

// The filter that takes ports of every kind.
inline constexpr USHORT GWSHADERPORT_ANY = 0xFFFF;
// The port index that no port has: nothing is left out.
inline constexpr ULONG GWSHADERPORT_NONE = 0xFFFF;

struct IGWShaderNodeEx : IUnknown {
protected:
    ~IGWShaderNodeEx() = default;
};

struct IGWShaderOpaque : IUnknown {
protected:
    ~IGWShaderOpaque() = default;
};

// Outputs are written only on S_OK.
struct IGWShaderPorts : IUnknown {
    // The node's first port; S_FALSE when it has none.
    virtual HRESULT STDMETHODCALLTYPE GetFirstPort(USHORT filter, tagGWShaderPort* port) = 0;
    // The first port nested in `port`; S_FALSE when it has none.
    virtual HRESULT STDMETHODCALLTYPE GetFirstChildPort(const tagGWShaderPort& port, USHORT filter,
                                                        tagGWShaderPort* child) = 0;
    // The port after `port`; S_FALSE after the last.
    virtual HRESULT STDMETHODCALLTYPE GetNextSiblingPort(const tagGWShaderPort& port, USHORT filter,
                                                         tagGWShaderPort* next) = 0;
    // S_OK when something is connected to `port`, S_FALSE when not.
    virtual HRESULT STDMETHODCALLTYPE IsPortConnected(const tagGWShaderPort& port) = 0;
    // The hierarchy connected to `port`, through `iid`; S_FALSE and null when none is.
    virtual HRESULT STDMETHODCALLTYPE GetConnectedHierarchy(const tagGWShaderPort& port, REFIID iid,
                                                            void** connected) = 0;

protected:
    ~IGWShaderPorts() = default;
};

struct IGWShaderPortIndex : IUnknown {
    // The index of the port a walk of the network does not follow (the node's own output).
    virtual HRESULT STDMETHODCALLTYPE GetSkippedPort(ULONG* index) = 0;

protected:
    ~IGWShaderPortIndex() = default;
};

struct I3DGenericNameSpace;

struct IGWNamedObject : IUnknown {
    // The name space the object belongs to now (one reference); S_FALSE and null for none.
    virtual HRESULT STDMETHODCALLTYPE GetNameSpace(I3DGenericNameSpace** current) = 0;
    // The name space the object would rather be in: S_OK with it, S_FALSE and null for no
    // preference.
    virtual HRESULT STDMETHODCALLTYPE GetPreferredNameSpace(I3DGenericNameSpace** preferred) = 0;
    // The object's name, task-allocated (the caller frees it with CoTaskMemFree).
    virtual HRESULT STDMETHODCALLTYPE GetName(wchar_t** name) = 0;

protected:
    ~IGWNamedObject() = default;
};

// A set of names: adding an object moves it here from the name space it was in.
struct I3DGenericNameSpace : IUnknown {
    // E_INVALIDARG for an object that cannot be named.
    virtual HRESULT STDMETHODCALLTYPE Add(IUnknown* object) = 0;

protected:
    ~I3DGenericNameSpace() = default;
};

template <>
struct ut::InterfaceId<IGWShaderPorts> : ut::Iid<IID_IGWShaderPorts> {};
template <>
struct ut::InterfaceId<IGWShaderNodeEx> : ut::Iid<IID_IGWShaderNodeEx> {};
template <>
struct ut::InterfaceId<IGWShaderPortIndex> : ut::Iid<IID_IGWShaderPortIndex> {};
template <>
struct ut::InterfaceId<IGWShaderOpaque> : ut::Iid<IID_IGWShaderOpaque> {};
template <>
struct ut::InterfaceId<IGWNamedObject> : ut::Iid<IID_IGWNamedObject> {};
template <>
struct ut::InterfaceId<I3DGenericNameSpace> : ut::Iid<IID_I3DGenericNameSpace> {};
