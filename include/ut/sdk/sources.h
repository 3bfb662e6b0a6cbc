// Sources and clips: a source is a file of images or animation the scene uses, a clip one use of
// a source. The scene keeps each kind in a container of its own (I3DScene::GetContainer with the
// keys below); both containers answer I3DSourceClipContainer, as any other container that lists
// sources or clips does. Every member answers IPersist (its class), IGWNamedObject (its name) and
// IGWActiveData (its flags); a source also answers I3DSource, a clip I3DClip.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/components.h>
#include <ut/sdk/export.h>

// {F16DA201-13A2-11D3-B37A-00105A1E70DE}
inline constexpr GUID GUID_3DSourcesContainerKey = {
    0xF16DA201, 0x13A2, 0x11D3, {0xB3, 0x7A, 0x00, 0x10, 0x5A, 0x1E, 0x70, 0xDE}};
// {F16DA202-13A2-11D3-B37A-00105A1E70DE}
inline constexpr GUID GUID_3DClipsContainerKey = {
    0xF16DA202, 0x13A2, 0x11D3, {0xB3, 0x7A, 0x00, 0x10, 0x5A, 0x1E, 0x70, 0xDE}};
// {F16DA200-13A2-11D3-B37A-00105A1E70DE}
inline constexpr IID IID_I3DSourceClipContainer = {
    0xF16DA200, 0x13A2, 0x11D3, {0xB3, 0x7A, 0x00, 0x10, 0x5A, 0x1E, 0x70, 0xDE}};
// {87DE29EC-1472-11D3-B37A-00105A1E70DE}
inline constexpr IID IID_I3DSource = {
    0x87DE29EC, 0x1472, 0x11D3, {0xB3, 0x7A, 0x00, 0x10, 0x5A, 0x1E, 0x70, 0xDE}};
// {E2A31590-3233-11D4-B982-009027BC3E07}
inline constexpr IID IID_I3DClip = {
    0xE2A31590, 0x3233, 0x11D4, {0xB9, 0x82, 0x00, 0x90, 0x27, 0xBC, 0x3E, 0x07}};
// {BB74AA1E-12C5-11D3-B37A-00105A1E70DE}
inline constexpr CLSID CLSID_3DImageSource = {
    0xBB74AA1E, 0x12C5, 0x11D3, {0xB3, 0x7A, 0x00, 0x10, 0x5A, 0x1E, 0x70, 0xDE}};
// {22C3E8F8-CCEA-11D2-B35B-00105A1E70DE}
inline constexpr CLSID CLSID_3DImageClip = {
    0x22C3E8F8, 0xCCEA, 0x11D2, {0xB3, 0x5B, 0x00, 0x10, 0x5A, 0x1E, 0x70, 0xDE}};
// {C38D4853-1911-42E2-8168-F9F758626E8F}: the other source class that source lists show beside
// image sources.
inline constexpr CLSID CLSID_3DListedSource = {
    0xC38D4853, 0x1911, 0x42E2, {0x81, 0x68, 0xF9, 0xF7, 0x58, 0x62, 0x6E, 0x8F}};

// What IGWActiveData::QueryObjects lists beside GWQUERY_NESTED: an object's operator stack (top
// first, `scope` and `depth` the caller's filters), and its owners (the folder that holds it first).
inline constexpr ULONG GWQUERY_OPERATORS = 1;
inline constexpr ULONG GWQUERY_OWNERS = 2;

struct I3DSourceClipContainer : IUnknown {
    // The members whose class is `filter` (GUID_NULL: all), in the container's order, through `iid`.
    virtual HRESULT STDMETHODCALLTYPE EnumChildren(REFGUID filter, REFIID iid, IGWEnumObjects** children) = 0;

protected:
    ~I3DSourceClipContainer() = default;
};

struct I3DSource : IUnknown {
    // The source's file, task-allocated (the caller frees it with CoTaskMemFree).
    virtual HRESULT STDMETHODCALLTYPE GetPath(wchar_t** path) = 0;

protected:
    ~I3DSource() = default;
};

struct I3DClip : IUnknown {
    // The source the clip uses, through `iid`.
    virtual HRESULT STDMETHODCALLTYPE GetSource(REFIID iid, void** source) = 0;

protected:
    ~I3DClip() = default;
};

// Whether two file paths name the same file as the application compares them: letter case
// ignored, and a slash the same as a backslash.
UT_SDK_API BOOL GWFilePathsEqual(const wchar_t* first, const wchar_t* second);

template <>
struct ut::InterfaceId<I3DSourceClipContainer> : ut::Iid<IID_I3DSourceClipContainer> {};
template <>
struct ut::InterfaceId<I3DSource> : ut::Iid<IID_I3DSource> {};
template <>
struct ut::InterfaceId<I3DClip> : ut::Iid<IID_I3DClip> {};
