// The image library as the library sees it: an image (its size, pixel format and pixels) and
// the service that loads one from a file.
//
// The reference host's loader reads uncompressed BMP files of 8 (grey palette only), 24 or 32
// bits per pixel into images of the 4-byte colour format (8-bit grey ones into the 1-byte grey
// format), rows top first. Every operation asks ut::sdk::CheckHostFault first, under
// "IGWImage::<method>" and "IGWImageLoader::<method>".
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

// Pixel formats: {0CB9135D-...} 1-byte grey, {0CB91360-...} 2-byte grey, {0CB9135C-...} 4 bytes
// r, g, b, a, {0CB9135E-...} four 16-bit channels r, g, b, a.
inline constexpr GUID GWPIXELFORMAT_GREY8 = {
    0x0CB9135D, 0x5A29, 0x11CE, {0xBA, 0xBC, 0x00, 0xAA, 0x00, 0x62, 0x92, 0x84}};
inline constexpr GUID GWPIXELFORMAT_GREY16 = {
    0x0CB91360, 0x5A29, 0x11CE, {0xBA, 0xBC, 0x00, 0xAA, 0x00, 0x62, 0x92, 0x84}};
inline constexpr GUID GWPIXELFORMAT_RGBA32 = {
    0x0CB9135C, 0x5A29, 0x11CE, {0xBA, 0xBC, 0x00, 0xAA, 0x00, 0x62, 0x92, 0x84}};
inline constexpr GUID GWPIXELFORMAT_RGBA64 = {
    0x0CB9135E, 0x5A29, 0x11CE, {0xBA, 0xBC, 0x00, 0xAA, 0x00, 0x62, 0x92, 0x84}};

// {6D2A1F40-8B3C-4E5D-A1F2-3C4D5E6F7081}
inline constexpr IID IID_IGWImage = {
    0x6D2A1F40, 0x8B3C, 0x4E5D, {0xA1, 0xF2, 0x3C, 0x4D, 0x5E, 0x6F, 0x70, 0x81}};
// {6D2A1F41-8B3C-4E5D-A1F2-3C4D5E6F7081} (the reference host's)
inline constexpr CLSID CLSID_GWImageLoader = {
    0x6D2A1F41, 0x8B3C, 0x4E5D, {0xA1, 0xF2, 0x3C, 0x4D, 0x5E, 0x6F, 0x70, 0x81}};
// {6D2A1F42-8B3C-4E5D-A1F2-3C4D5E6F7081}
inline constexpr IID IID_IGWImageLoader = {
    0x6D2A1F42, 0x8B3C, 0x4E5D, {0xA1, 0xF2, 0x3C, 0x4D, 0x5E, 0x6F, 0x70, 0x81}};

struct IGWImage : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE GetSize(ULONG* width, ULONG* height) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetPixelFormat(GUID* format) = 0;
    // The image's own pixels, rows of `width` pixels top first, valid while the image lives.
    virtual HRESULT STDMETHODCALLTYPE GetPixels(void** pixels) = 0;

protected:
    ~IGWImage() = default;
};

struct IGWImageLoader : IUnknown {
    // E_INVALIDARG for a file of another kind, STG_E_FILENOTFOUND for a missing one.
    virtual HRESULT STDMETHODCALLTYPE LoadFile(const wchar_t* path, IGWImage** image) = 0;
    // An image of `format` over a copy of `pixels` (rows of `width` pixels, top first).
    virtual HRESULT STDMETHODCALLTYPE CreateImage(ULONG width, ULONG height, REFGUID format,
                                                  const void* pixels, IGWImage** image) = 0;

protected:
    ~IGWImageLoader() = default;
};

template <>
struct ut::InterfaceId<IGWImage> : ut::Iid<IID_IGWImage> {};
template <>
struct ut::InterfaceId<IGWImageLoader> : ut::Iid<IID_IGWImageLoader> {};

// The application's image loader (found through GWQueryGenericObject).
UT_SDK_API HRESULT KXGetImageLoader(IGWImageLoader** loader);
