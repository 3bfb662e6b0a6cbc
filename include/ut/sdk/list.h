// Lists of element references: the host's creatable list, the element that points at an object
// (or at a component inside one), and the enumeration of a list's elements.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/components.h>

// {F49F6471-4211-11D0-8463-00A024C7919C}: the creatable list.
inline constexpr CLSID CLSID_3DList = {
    0xF49F6471, 0x4211, 0x11D0, {0x84, 0x63, 0x00, 0xA0, 0x24, 0xC7, 0x91, 0x9C}};
// {F49F6470-4211-11D0-8463-00A024C7919C}
inline constexpr IID IID_I3DList = {
    0xF49F6470, 0x4211, 0x11D0, {0x84, 0x63, 0x00, 0xA0, 0x24, 0xC7, 0x91, 0x9C}};
// {872903D0-3EF3-11D0-8463-00A024C7919C}
inline constexpr IID IID_I3DElemRef = {
    0x872903D0, 0x3EF3, 0x11D0, {0x84, 0x63, 0x00, 0xA0, 0x24, 0xC7, 0x91, 0x9C}};
// {00860D11-3488-47FB-A362-B488CF45FA08}
inline constexpr IID IID_IEnum3DElemRef = {
    0x00860D11, 0x3488, 0x47FB, {0xA3, 0x62, 0xB4, 0x88, 0xCF, 0x45, 0xFA, 0x08}};

struct I3DGroup;

struct I3DElemRef : IUnknown {
    // Points the element at `object`, or at `component` inside it when that is not null.
    virtual HRESULT STDMETHODCALLTYPE SetTarget(IUnknown* object, const tagGWComponent* component) = 0;
    // The object pointed at, through `iid`; with `final` non-zero an element that points at
    // another element is followed to the object at the end. S_FALSE and null when it points at
    // nothing.
    virtual HRESULT STDMETHODCALLTYPE GetTarget(REFIID iid, void** object, LONG final) = 0;
    // Makes the object pointed at stand for `group` in `scene`; takes effect on Update.
    virtual HRESULT STDMETHODCALLTYPE SetAsGroup(IUnknown* scene, I3DGroup* group) = 0;
    // Applies the changes made through the element; `notify` non-zero tells the application.
    virtual HRESULT STDMETHODCALLTYPE Update(LONG notify) = 0;

protected:
    ~I3DElemRef() = default;
};

struct IEnum3DElemRef : IUnknown {
    // Up to `count` elements; S_FALSE when fewer were left. `fetched` may be null when count is 1.
    virtual HRESULT STDMETHODCALLTYPE Next(ULONG count, I3DElemRef** elements, ULONG* fetched) = 0;
    virtual HRESULT STDMETHODCALLTYPE Skip(ULONG count) = 0;
    virtual HRESULT STDMETHODCALLTYPE Reset() = 0;
    virtual HRESULT STDMETHODCALLTYPE Clone(IEnum3DElemRef** copy) = 0;

protected:
    ~IEnum3DElemRef() = default;
};

struct I3DList : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE GetCount(ULONG* count) = 0;
    // The element at `index`; DISP_E_BADINDEX past the end.
    virtual HRESULT STDMETHODCALLTYPE GetItem(ULONG index, I3DElemRef** element) = 0;
    // A new element of the list's kind, through `iid`; it joins the list on Append.
    virtual HRESULT STDMETHODCALLTYPE NewElement(REFIID iid, void** element) = 0;
    // Adds `element` at the end (the list holds a reference).
    virtual HRESULT STDMETHODCALLTYPE Append(I3DElemRef* element) = 0;
    // An enumeration of the elements in order.
    virtual HRESULT STDMETHODCALLTYPE EnumElements(IEnum3DElemRef** elements) = 0;

protected:
    ~I3DList() = default;
};

template <>
struct ut::InterfaceId<I3DElemRef> : ut::Iid<IID_I3DElemRef> {};
template <>
struct ut::InterfaceId<IEnum3DElemRef> : ut::Iid<IID_IEnum3DElemRef> {};
template <>
struct ut::InterfaceId<I3DList> : ut::Iid<IID_I3DList> {};
