// Property sets: the host's holders of parameters and of further property sets, the enumeration
// of what a set holds, the owner through which an object hands out its sets, and the request
// record that says who changes a value.
//
// A property set has a class (what it is, such as a transform) and a kind (what role it plays;
// every set an object owns is of kind GUID_GWPropertySetKind). Its parameters are values named
// by GUID; one of them, GUID_GWValueParameter, is the set's own value. Its members are further
// property sets, found by class or by kind.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>
#include <ut/sdk/variant.h>

// {2BABED40-B813-11CF-B646-00A024191AE0}
inline constexpr IID IID_IGWProperties = {
    0x2BABED40, 0xB813, 0x11CF, {0xB6, 0x46, 0x00, 0xA0, 0x24, 0x19, 0x1A, 0xE0}};
// {616F8769-1A7E-46D4-B30B-584B97FDA0B2}
inline constexpr IID IID_IGWParameter = {
    0x616F8769, 0x1A7E, 0x46D4, {0xB3, 0x0B, 0x58, 0x4B, 0x97, 0xFD, 0xA0, 0xB2}};
// {3B6D5C03-B8A4-47F0-88DC-873333B8302F}
inline constexpr IID IID_IEnumGWProperties = {
    0x3B6D5C03, 0xB8A4, 0x47F0, {0x88, 0xDC, 0x87, 0x33, 0x33, 0xB8, 0x30, 0x2F}};
// {DB538A50-5ADC-11D1-9267-08003629EA02}
inline constexpr IID IID_IGWPropertyOwner = {
    0xDB538A50, 0x5ADC, 0x11D1, {0x92, 0x67, 0x08, 0x00, 0x36, 0x29, 0xEA, 0x02}};

// {0E1A4F60-0509-11D1-AA94-00A0243E34C4}: the kind of the property sets an object owns.
inline constexpr GUID GUID_GWPropertySetKind = {
    0x0E1A4F60, 0x0509, 0x11D1, {0xAA, 0x94, 0x00, 0xA0, 0x24, 0x3E, 0x34, 0xC4}};
// {B20A80FB-FF66-11D3-B7DD-0008C7A011A6}: the value parameter of a property set (for the key time,
// a frame count as VT_R8).
inline constexpr GUID GUID_GWValueParameter = {
    0xB20A80FB, 0xFF66, 0x11D3, {0xB7, 0xDD, 0x00, 0x08, 0xC7, 0xA0, 0x11, 0xA6}};

// Who asks for a change; the host keeps it with the change (for undo and notification).
struct tagGWREQUEST {
    ULONG kind;
};
// A change a plug-in makes on the user's behalf.
inline constexpr ULONG GWREQUEST_PLUGIN = 18;

// What an enumeration hands out (selection bits; others are the host's and ignored here), and
// what each entry is (its flags).
inline constexpr ULONG GWPROPERTY_PARAMETERS = 0x1;
inline constexpr ULONG GWPROPERTY_MEMBERS = 0x2;

// One entry of an enumeration: a parameter (its id, name and value) or a member set (its class,
// name, and the set itself as VT_UNKNOWN). The receiver owns `name` (task memory) and `value`.
struct tagGWPROPERTY {
    GUID id;
    ULONG flags;
    LPOLESTR name;
    GWVARIANT value;
};

struct IEnumGWProperties : IUnknown {
    // Up to `count` entries; S_FALSE when fewer were left. `fetched` may be null when count is 1.
    virtual HRESULT STDMETHODCALLTYPE Next(ULONG count, tagGWPROPERTY* entries, ULONG* fetched) = 0;
    virtual HRESULT STDMETHODCALLTYPE Skip(ULONG count) = 0;
    virtual HRESULT STDMETHODCALLTYPE Reset() = 0;
    virtual HRESULT STDMETHODCALLTYPE Clone(IEnumGWProperties** copy) = 0;

protected:
    ~IEnumGWProperties() = default;
};

struct IGWParameter : IUnknown {
    // Copies the value into `value` (initialised by the caller, who clears it).
    virtual HRESULT STDMETHODCALLTYPE GetParamValue(GWVARIANT* value) = 0;
    // Sets the value; DISP_E_TYPEMISMATCH for a type the parameter does not hold.
    virtual HRESULT STDMETHODCALLTYPE SetParamValue(const tagGWREQUEST* request, const GWVARIANT* value) = 0;

protected:
    ~IGWParameter() = default;
};

// Outputs are cleared first; a null one answers E_POINTER.
struct IGWProperties : IUnknown {
    // Copies parameter `id` into `value` (initialised by the caller, who clears it);
    // DISP_E_MEMBERNOTFOUND for a parameter the set does not have.
    virtual HRESULT STDMETHODCALLTYPE GetParameterValue(REFGUID id, GWVARIANT* value) = 0;
    // Sets the value parameter, as IGWParameter::SetParamValue does.
    virtual HRESULT STDMETHODCALLTYPE SetValue(const tagGWREQUEST* request, const GWVARIANT* value) = 0;
    // Tells the application that the set changed; `redraw` also redraws the views showing it.
    // The last two arguments are reserved (0).
    virtual HRESULT STDMETHODCALLTYPE Refresh(const tagGWREQUEST* request, BOOL redraw, LONG reserved1,
                                              LONG reserved2) = 0;
    // The first member of class `clsid` as VT_UNKNOWN in `value` (empty and cleared by the caller);
    // `flags` is 0. DISP_E_MEMBERNOTFOUND when there is none.
    virtual HRESULT STDMETHODCALLTYPE GetProperty(REFGUID clsid, GWVARIANT* value, LONG flags) = 0;
    // The number of members whose class or kind is `filter`.
    virtual HRESULT STDMETHODCALLTYPE CountMembers(REFGUID filter, ULONG* count) = 0;
    // `count` of those members from position `first` into `members` (one reference each);
    // DISP_E_BADINDEX, with nothing handed out, when fewer are there.
    virtual HRESULT STDMETHODCALLTYPE GetMembers(REFGUID filter, ULONG first, ULONG count,
                                                 IGWProperties** members) = 0;
    // The parameters and members that `selection` asks for, parameters first, in order.
    virtual HRESULT STDMETHODCALLTYPE EnumProperties(ULONG selection, IEnumGWProperties** entries) = 0;

protected:
    ~IGWProperties() = default;
};

struct IGWPropertyOwner : IUnknown {
    // The collection of the object's property sets (its members are the sets, of kind
    // GUID_GWPropertySetKind); S_OK with null when the object has none.
    virtual HRESULT STDMETHODCALLTYPE GetPropertySets(IGWProperties** sets) = 0;

protected:
    ~IGWPropertyOwner() = default;
};

template <>
struct ut::InterfaceId<IGWParameter> : ut::Iid<IID_IGWParameter> {};
template <>
struct ut::InterfaceId<IGWProperties> : ut::Iid<IID_IGWProperties> {};
template <>
struct ut::InterfaceId<IEnumGWProperties> : ut::Iid<IID_IEnumGWProperties> {};
template <>
struct ut::InterfaceId<IGWPropertyOwner> : ut::Iid<IID_IGWPropertyOwner> {};

namespace ut::sdk {

// Frees what an enumeration entry owns and empties it.
inline void ClearProperty(tagGWPROPERTY& entry) noexcept {
    CoTaskMemFree(entry.name);
    entry.name = nullptr;
    (void)GWVariantClear(&entry.value); // cannot fail on a value the host made
}

} // namespace ut::sdk
