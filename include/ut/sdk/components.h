// Component hierarchies: the addresses of the parts of an object (components), the hierarchy that
// walks them, the object's active data (its flags, parameter lookup and the hierarchies nested in
// it), the set-value proxy through which a parameter is set as an undoable command, and the
// parameter dictionary that says more about a parameter than its id.
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
// {8C80DEE3-1064-11D3-B0B7-00A0C982A112}: a hierarchy whose components can be read one by one.
inline constexpr IID IID_IGWComponentAccess = {
    0x8C80DEE3, 0x1064, 0x11D3, {0xB0, 0xB7, 0x00, 0xA0, 0xC9, 0x82, 0xA1, 0x12}};
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
    // The hierarchy of another object that `component` stands for (a referenced model), through
    // `iid`; S_FALSE and null when it stands for none.
    virtual HRESULT STDMETHODCALLTYPE GetNestedHierarchy(const tagGWComponent& component, REFIID iid,
                                                         void** nested) = 0;
    // Moves the object that `component` addresses below the hierarchy's object, first or last
    // (GWDEST_FIRST 0, GWDEST_LAST 3: `reference` null) or before or after the object `reference`
    // addresses (1, 2). E_INVALIDARG for an object that cannot go there.
    virtual HRESULT STDMETHODCALLTYPE MoveComponent(const tagGWComponent& component, LONG destination,
                                                    const tagGWComponent* reference) = 0;

protected:
    ~IGWComponentHierarchy() = default;
};

// The flags of an object's active data.
inline constexpr ULONG GWACTIVEDATA_SELECTED = 0x1;
inline constexpr ULONG GWACTIVEDATA_HIDDEN = 0x8;

// Marks a hierarchy whose components can be read one by one; it has no operations of its own.
struct IGWComponentAccess : IUnknown {
protected:
    ~IGWComponentAccess() = default;
};

// {0C7C1E0B-2C0D-4E43-A4F4-6A5B5E0E7C21}
inline constexpr IID IID_IGWEnumObjects = {
    0x0C7C1E0B, 0x2C0D, 0x4E43, {0xA4, 0xF4, 0x6A, 0x5B, 0x5E, 0x0E, 0x7C, 0x21}};
// Objects handed out one at a time.
struct IGWEnumObjects : IUnknown {
    // The next object (one reference); S_FALSE and null after the last.
    virtual HRESULT STDMETHODCALLTYPE Next(IUnknown** object) = 0;

protected:
    ~IGWEnumObjects() = default;
};

// What IGWActiveData::QueryObjects lists: the hierarchies nested in the object (the objects below
// it and the models it references), in the hierarchy's order.
inline constexpr ULONG GWQUERY_NESTED = 3;

struct IGWActiveData : IUnknown {
    // The object's GWACTIVEDATA_* flags.
    virtual HRESULT STDMETHODCALLTYPE GetFlags(ULONG* flags) = 0;
    // The component of parameter `id` in the object's hierarchy; DISP_E_MEMBERNOTFOUND when the
    // object has no such parameter.
    virtual HRESULT STDMETHODCALLTYPE FindParameter(REFGUID id, tagGWComponent* parameter) = 0;
    // The objects that `query` (GWQUERY_*) lists, through `iid`, whose class is `filter` (GUID_NULL:
    // any). `scope` and `depth` are the application's options (the library passes 16 and 4).
    // E_INVALIDARG for a query the object does not know.
    virtual HRESULT STDMETHODCALLTYPE QueryObjects(ULONG query, ULONG scope, ULONG depth, REFGUID filter,
                                                   REFIID iid, IGWEnumObjects** objects) = 0;
    // Moves go through four steps: an object is resolved to a handle (S_OK, or S_FALSE for an
    // object this one cannot hold), the handle to the component that addresses the object here;
    // CheckComponent says whether the object is in the scene (S_OK) or not (S_FALSE); FollowUp
    // turns a component into a handle again, and FetchObject hands out, for index -2, the object's
    // present parent (S_FALSE and null for none).
    virtual HRESULT STDMETHODCALLTYPE ResolveObject(IUnknown* object, ULONG* handle) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetComponentRecord(ULONG handle, tagGWComponent* component) = 0;
    virtual HRESULT STDMETHODCALLTYPE CheckComponent(const tagGWComponent& component) = 0;
    virtual HRESULT STDMETHODCALLTYPE FollowUp(const tagGWComponent& component, ULONG* handle) = 0;
    virtual HRESULT STDMETHODCALLTYPE FetchObject(ULONG handle, LONG index, REFIID iid, void** object) = 0;

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

// {8EF54030-3E58-11D1-B6E8-00AA003B3EA6}: the parameter dictionary, by interface.
inline constexpr IID IID_IGWParamDict = {
    0x8EF54030, 0x3E58, 0x11D1, {0xB6, 0xE8, 0x00, 0xAA, 0x00, 0x3B, 0x3E, 0xA6}};
// {FD41AE6A-5DA1-4F2B-9B37-13A5C0C2AE10}: where GWGetParamDict finds the application's dictionary
// (the reference host's; an application installs its own under this class).
inline constexpr CLSID CLSID_GWParamDict = {
    0xFD41AE6A, 0x5DA1, 0x4F2B, {0x9B, 0x37, 0x13, 0xA5, 0xC0, 0xC2, 0xAE, 0x10}};
// {8C80DEF3-1064-11D3-B0B7-00A0C982A112}: the parameter of a dictionary entry that holds, as a
// GW_VT_GUID, the id a parameter is also known by (GUID_NULL or missing: none).
inline constexpr GUID GUID_GWParamAlias = {
    0x8C80DEF3, 0x1064, 0x11D3, {0xB0, 0xB7, 0x00, 0xA0, 0xC9, 0x82, 0xA1, 0x12}};

struct IGWProperties;

// What the application knows about parameters, by their id.
struct IGWParamDict : IUnknown {
    // The entry of parameter `id` (one reference); DISP_E_MEMBERNOTFOUND for an id it does not know.
    virtual HRESULT STDMETHODCALLTYPE FindEntry(REFGUID id, IGWProperties** entry) = 0;

protected:
    ~IGWParamDict() = default;
};

template <>
struct ut::InterfaceId<IGWComponentHierarchy> : ut::Iid<IID_IGWComponentHierarchy> {};
template <>
struct ut::InterfaceId<IGWComponentAccess> : ut::Iid<IID_IGWComponentAccess> {};
template <>
struct ut::InterfaceId<IGWEnumObjects> : ut::Iid<IID_IGWEnumObjects> {};
template <>
struct ut::InterfaceId<IGWParamDict> : ut::Iid<IID_IGWParamDict> {};
template <>
struct ut::InterfaceId<IGWActiveData> : ut::Iid<IID_IGWActiveData> {};
template <>
struct ut::InterfaceId<IGWSetValueProxy> : ut::Iid<IID_IGWSetValueProxy> {};

// The application's set-value proxy for `hierarchy`, through `iid`. E_POINTER for a null
// hierarchy; REGDB_E_CLASSNOTREG when the application installed no proxy.
UT_SDK_API HRESULT GWGetSetValueProxy(IGWComponentHierarchy* hierarchy, REFIID iid, void** proxy);
// The application's parameter dictionary through `iid`; `outer` is reserved (null).
// REGDB_E_CLASSNOTREG when the application installed none.
UT_SDK_API HRESULT GWGetParamDict(REFIID iid, void** dict, IUnknown* outer);
