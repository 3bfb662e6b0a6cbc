// The image library as the library sees it: an image (its size, pixel format and pixels), the
// service that loads one from a file, new images of the library's image class, scaling one
// image into another, and an image as a device bitmap.
//
// The reference host's loader reads uncompressed BMP files of 8 (grey palette only), 24 or 32
// bits per pixel into images of the 4-byte colour format (8-bit grey ones into the 1-byte grey
// format), rows top first. Every operation asks ut::sdk::CheckHostFault first, under
// "IGWImage::<method>", "IGWImageSetup::<method>", "IGWImageLoader::<method>" and the names of the
// three library functions at the end of this header.
#pragma once

#include <cstddef>

#include <ut/platform/bitmap.h>
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

// {26C0E591-63A1-11CE-BABC-00AA00629284}: the image library's own image, made by kxILCreateImage.
inline constexpr CLSID CLSID_GWImage = {
    0x26C0E591, 0x63A1, 0x11CE, {0xBA, 0xBC, 0x00, 0xAA, 0x00, 0x62, 0x92, 0x84}};
// {6D2A1F43-8B3C-4E5D-A1F2-3C4D5E6F7081}
inline constexpr IID IID_IGWImageSetup = {
    0x6D2A1F43, 0x8B3C, 0x4E5D, {0xA1, 0xF2, 0x3C, 0x4D, 0x5E, 0x6F, 0x70, 0x81}};

struct IGWImage : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE GetSize(ULONG* width, ULONG* height) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetPixelFormat(GUID* format) = 0;
    // The image's own pixels, rows of `width` pixels top first, valid while the image lives.
    virtual HRESULT STDMETHODCALLTYPE GetPixels(void** pixels) = 0;

protected:
    ~IGWImage() = default;
};

// The shape of an image of the library's image class. A new image is 0 x 0 of the 4-byte colour
// format; either call gives it new pixels of the new shape, all bytes 0 (transparent black).
struct IGWImageSetup : IUnknown {
    // E_INVALIDARG for a format other than the four above.
    virtual HRESULT STDMETHODCALLTYPE SetPixelFormat(REFGUID format) = 0;
    // E_INVALIDARG beyond 32768 pixels on a side.
    virtual HRESULT STDMETHODCALLTYPE SetSize(ULONG width, ULONG height) = 0;

protected:
    ~IGWImageSetup() = default;
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
struct ut::InterfaceId<IGWImageSetup> : ut::Iid<IID_IGWImageSetup> {};
template <>
struct ut::InterfaceId<IGWImageLoader> : ut::Iid<IID_IGWImageLoader> {};

// Bytes a pixel of `format` takes: 1, 2, 4 or 8, and 0 for a format other than the four above.
UT_SDK_API std::size_t GWPixelFormatSize(REFGUID format);

// The application's image loader (found through GWQueryGenericObject).
UT_SDK_API HRESULT KXGetImageLoader(IGWImageLoader** loader);

// A new image of `imageClass` (CLSID_GWImage), through the application's creatable classes.
// CLASS_E_NOAGGREGATION for an `outer` object: the library's images are never aggregated.
UT_SDK_API HRESULT kxILCreateImage(IUnknown* outer, REFCLSID imageClass, IGWImage** image);

// How kxILScaleTranslateImage samples the source.
inline constexpr int KXIL_INTERPOLATE_NEAREST = 0;  // the source pixel under the target pixel's centre
inline constexpr int KXIL_INTERPOLATE_BILINEAR = 3; // the four source pixels around it, weighted

// Draws `source` into `target`: target pixel (x, y) shows the source at
// ((x + 0.5 - translateX) / scaleX, (y + 0.5 - translateY) / scaleY), pixel centres at +0.5.
// Only target pixels whose centre falls inside the source are written; the others keep what they
// hold. Bilinear sampling weighs the four nearest source pixel centres, the image's edge pixels
// repeated beyond it, and rounds each channel to the nearest value: scale 1 copies pixels exactly,
// scale 0.5 averages each 2 x 2 block. Formats are converted through 8-bit red, green, blue and
// alpha (grey is the rounded 0.299 r + 0.587 g + 0.114 b; a 16-bit channel is its high byte, and
// is written as the byte repeated). E_INVALIDARG for a scale that is not positive and finite, an
// interpolation other than 0 and 3, or an image of another format.
UT_SDK_API HRESULT kxILScaleTranslateImage(IGWImage* source, IGWImage* target, double scaleX, double scaleY,
                                           double translateX, double translateY, int interpolation);

struct UT_SDK_API KXImageHlp {
    // A 32-bit device bitmap of the image's size with the image's pixels (blue, green, red, alpha
    // in each), for the caller to delete with DeleteObject. E_INVALIDARG for an empty image or one
    // of another format; nothing is left behind on failure.
    static HRESULT CreateBitmapFromImage(IGWImage* image, HBITMAP* bitmap);
};
