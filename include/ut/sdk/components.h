// Component hierarchies: the addresses of the parts of an object (components), the hierarchy that
// walks them, the object's active data (its flags and parameter lookup), and the set-value proxy
// through which a parameter is set as an undoable command.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>
#include <ut/sdk/variant.h>

// {4AEAEAEA-1A43-11D2-8D66-00A0C982A649}
inline constexpr IID IID_IGWComponentHierarchy = {
    0x4AEAEAEA, 0x1A43, 0x11D2, {0x8D, 0x66, 0x00, 0xA0, 0xC9, 0x82, 0xA6, 0x49}};
// {6DE1B670-8072-11D5-AEED-0090275802C9}
inline constexpr IID IID_IGWActiveData = {
    0x6DE1B670, 0x8072, 0x11D5, {0xAE, 0xED, 0x00, 0x90, 0x27, 0x58, 0x02, 0xC9}};
// {35FAD5F1-D568-11D2-A960-00A024190119}
inline constexpr IID IID_IGWSetValueProxy = {
    0x35FAD5F1, 0xD568, 0x11D2, {0xA9, 0x60, 0x00, 0xA0, 0x24, 0x19, 0x01, 0x19}};
// {7E28E86F-8086-40E0-9558-BD68E47BF4E0}: where GWGetSetValueProxy finds the application's proxy
// (the reference host's; an application installs its own proxy under this class).
inline constexpr CLSID CLSID_GWSetValueProxy = {
    0x7E28E86F, 0x8086, 0x40E0, {0x95, 0x58, 0xBD, 0x68, 0xE4, 0x7B, 0xF4, 0xE0}};

// The address of a component inside its hierarchy. `size` counts the meaningful bytes after the
// four-byte head (the id and as much of `data` as the host uses); two addresses are the same
// component when their first size + 4 bytes are equal. `id` identifies the component.
struct tagGWComponent {
    BYTE kind;
    BYTE size;
    USHORT flags;
    ULONG id;
    BYTE data[16];
};
static_assert(sizeof(tagGWComponent) == 24);

// The depth argument of the walking operations that lets the walk go anywhere.
inline constexpr USHORT GWCOMPONENT_ANY_DEPTH = 0xFFFF;

// Outputs are written only on S_OK; an address the hierarchy does not hold answers E_INVALIDARG.
struct IGWComponentHierarchy : IUnknown {
    // The component that stands for the whole object.
    virtual HRESULT STDMETHODCALLTYPE GetRootComponent(tagGWComponent* root) = 0;
    // The GUID that says what the component is (a parameter's id, a property set's class).
    virtual HRESULT STDMETHODCALLTYPE GetComponentGuid(const tagGWComponent& component, GUID* guid) = 0;
    // The first child of `component` at most `depth` levels down; S_FALSE when it has none.
    virtual HRESULT STDMETHODCALLTYPE GetFirstChild(const tagGWComponent& component, USHORT depth,
                                                    tagGWComponent* child) = 0;
    // The next sibling of `component`; S_FALSE after the last.
    virtual HRESULT STDMETHODCALLTYPE GetNextSibling(const tagGWComponent& component, USHORT depth,
                                                     tagGWComponent* sibling) = 0;

protected:
    ~IGWComponentHierarchy() = default;
};

// The flags of an object's active data.
inline constexpr ULONG GWACTIVEDATA_SELECTED = 0x1;
inline constexpr ULONG GWACTIVEDATA_HIDDEN = 0x8;

struct IGWActiveData : IUnknown {
    // The object's GWACTIVEDATA_* flags.
    virtual HRESULT STDMETHODCALLTYPE GetFlags(ULONG* flags) = 0;
    // The component of parameter `id` in the object's hierarchy; DISP_E_MEMBERNOTFOUND when the
    // object has no such parameter.
    virtual HRESULT STDMETHODCALLTYPE FindParameter(REFGUID id, tagGWComponent* parameter) = 0;

protected:
    ~IGWActiveData() = default;
};

struct IGWSetValueProxy : IUnknown {
    // Sets `parameter` of `hierarchy` to `value` at `seconds`, as one undoable command made for
    // `request` (a tagGWREQUEST kind, 0 for the application itself). `flags` is reserved (0).
    virtual HRESULT STDMETHODCALLTYPE SetValue(ULONG request, IGWComponentHierarchy* hierarchy,
                                               const tagGWComponent& parameter, ULONG flags,
                                               const GWVARIANT* value, double seconds) = 0;

protected:
    ~IGWSetValueProxy() = default;
};

template <>
struct ut::InterfaceId<IGWComponentHierarchy> : ut::Iid<IID_IGWComponentHierarchy> {};
template <>
struct ut::InterfaceId<IGWActiveData> : ut::Iid<IID_IGWActiveData> {};
template <>
struct ut::InterfaceId<IGWSetValueProxy> : ut::Iid<IID_IGWSetValueProxy> {};

// The application's set-value proxy for `hierarchy`, through `iid`. E_POINTER for a null
// hierarchy; REGDB_E_CLASSNOTREG when the application installed no proxy.
UT_SDK_API HRESULT GWGetSetValueProxy(IGWComponentHierarchy* hierarchy, REFIID iid, void** proxy);
