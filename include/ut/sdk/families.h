// Object families: named sets of classes kept by the host's families manager. Plug-ins create
// families and join their classes to them when they register (GWRegisterFamily,
// GWRegisterObjectFamilies), and the application lists a family's members and tests a class's
// membership.
//
// The reference host keeps families in the registry, under HKEY_LOCAL_MACHINE
// "Software\ut\Families": a family's key is named by its identifier text and holds its
// description as values ("Class", "Parent", "Kind", "Path", "Module", "Editor", "Inspector"; an
// identifier given as GUID_NULL and a null text are not written); its sub-key "Members" holds one
// key per member class, with the "Name" and "Flag" given when the class joined. A family's key
// goes when it has neither a description nor members.
//
// Every operation asks ut::sdk::CheckHostFault first, under "IGWFamiliesManager::<method>".
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// {66E0E683-A2CF-49EB-A89D-4E8221B90A5B}
inline constexpr IID IID_IGWEnumGUID = {
    0x66E0E683, 0xA2CF, 0x49EB, {0xA8, 0x9D, 0x4E, 0x82, 0x21, 0xB9, 0x0A, 0x5B}};

// A list of identifiers handed out one or more at a time.
struct IGWEnumGUID : IUnknown {
    // Copies up to `count` identifiers to `ids` and says how many in *fetched (which may be null
    // when `count` is 1): S_OK when `count` were copied, S_FALSE when the list ran out first.
    virtual HRESULT STDMETHODCALLTYPE Next(ULONG count, GUID* ids, ULONG* fetched) = 0;
    // Starts again from the first identifier.
    virtual HRESULT STDMETHODCALLTYPE Reset() = 0;

protected:
    ~IGWEnumGUID() = default;
};

// {66E0E681-A2CF-49EB-A89D-4E8221B90A5B} (the reference host's; an application installs its own
// manager under this class)
inline constexpr CLSID CLSID_GWFamiliesManager = {
    0x66E0E681, 0xA2CF, 0x49EB, {0xA8, 0x9D, 0x4E, 0x82, 0x21, 0xB9, 0x0A, 0x5B}};
// {66E0E682-A2CF-49EB-A89D-4E8221B90A5B}
inline constexpr IID IID_IGWFamiliesManager = {
    0x66E0E682, 0xA2CF, 0x49EB, {0xA8, 0x9D, 0x4E, 0x82, 0x21, 0xB9, 0x0A, 0x5B}};

// GUID_NULL is never a family or a member: it answers E_INVALIDARG. A null identifier list with a
// non-zero count answers E_POINTER; a zero count does nothing and answers S_OK.
struct IGWFamiliesManager : IUnknown {
    // Describes `family` (creating it when it is new), replacing an earlier description; its
    // members stay.
    virtual HRESULT STDMETHODCALLTYPE RegisterFamily(REFGUID family, REFCLSID familyClass, REFGUID parent,
                                                     const wchar_t* kind, const wchar_t* path,
                                                     HINSTANCE module, REFCLSID editor,
                                                     REFCLSID inspector) = 0;
    // Removes the family's description, whichever module gave it; the family goes with it when it
    // has no members left. S_FALSE when it had no description.
    virtual HRESULT STDMETHODCALLTYPE UnregisterFamily(REFGUID family, HINSTANCE module) = 0;
    // Makes `clsid` a member of each of the `count` families (a family that was not described
    // before exists from then on), with the name and flag given. Joining again replaces them.
    virtual HRESULT STDMETHODCALLTYPE RegisterMembers(REFCLSID clsid, ULONG count, const GUID* families,
                                                      BOOL flag, const wchar_t* name, HINSTANCE module) = 0;
    // Ends the membership of `clsid` in each of the families: S_OK, or S_FALSE when it was not a
    // member of one of them.
    virtual HRESULT STDMETHODCALLTYPE UnregisterMembers(REFCLSID clsid, ULONG count, const GUID* families,
                                                        HINSTANCE module) = 0;
    // The members of `family` as they are now, in the registry's order; an unknown family has
    // none. E_POINTER for a null out-parameter.
    virtual HRESULT STDMETHODCALLTYPE EnumMembers(REFGUID family, IGWEnumGUID** members) = 0;
    // S_OK when `clsid` is a member of `family`, S_FALSE when it is not.
    virtual HRESULT STDMETHODCALLTYPE IsMember(REFCLSID clsid, REFGUID family) = 0;
    // Every family there is (described, or with members only), in the registry's order.
    virtual HRESULT STDMETHODCALLTYPE EnumFamilies(IGWEnumGUID** families) = 0;
    // The family's name in task memory that the caller frees: the kind text it was described
    // with, empty for a family with members only. DISP_E_MEMBERNOTFOUND for an unknown family.
    virtual HRESULT STDMETHODCALLTYPE GetFamilyName(REFGUID family, LPOLESTR* name) = 0;
    // The families `clsid` is a member of. With a null `families` *count is how many there are;
    // otherwise up to `capacity` of them are copied and *count says how many.
    virtual HRESULT STDMETHODCALLTYPE GetClassFamilies(REFCLSID clsid, ULONG capacity, GUID* families,
                                                       ULONG* count) = 0;

protected:
    ~IGWFamiliesManager() = default;
};

template <>
struct ut::InterfaceId<IGWEnumGUID> : ut::Iid<IID_IGWEnumGUID> {};
template <>
struct ut::InterfaceId<IGWFamiliesManager> : ut::Iid<IID_IGWFamiliesManager> {};

// The application's families manager (found through GWQueryGenericObject).
UT_SDK_API HRESULT GWGetFamiliesManager(IGWFamiliesManager** manager);

// The registration calls of plug-ins, each the manager's operation of the same arguments; a
// manager that cannot be had answers its failure.
UT_SDK_API HRESULT GWRegisterFamily(REFGUID family, REFCLSID familyClass, REFGUID parent, const wchar_t* kind,
                                    const wchar_t* path, HINSTANCE module, REFCLSID editor,
                                    REFCLSID inspector);
UT_SDK_API HRESULT GWUnregisterFamily(REFGUID family, HINSTANCE module);
UT_SDK_API HRESULT GWRegisterObjectFamilies(REFCLSID clsid, unsigned int count, const GUID* families,
                                            bool flag, const wchar_t* name, HINSTANCE module);
UT_SDK_API HRESULT GWUnregisterObjectFamilies(REFCLSID clsid, unsigned int count, const GUID* families,
                                              HINSTANCE module);
