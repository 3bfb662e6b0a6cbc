// Pictures of the scene for thumbnails: the application's scene viewer and its picture source,
// a device bitmap turned back into an image, and the thumbnail of a compound file written and read.
//
// The library finds the picture source with two generic-object queries, (CLSID_GWSceneViewer,
// IID_IGWSceneViewer) then (CLSID_GWPictureSource, IID_IGWPictureSource); an application installs
// both while it has a view of the scene to take a picture from, and neither otherwise.
//
// A thumbnail lives where standard tools look for a document's picture: in the stream
// "\005SummaryInformation" of the root storage, a property set stream (format identifier
// GUID_GWSummaryInformation) whose property 17 holds a clipboard value: its size (4 plus the bytes
// that follow), the tag -1 (a system clipboard format), the format 8 (a device-independent bitmap),
// then the bitmap: a 40-byte information header and 24-bit rows, bottom row first, each padded to
// 4 bytes. Every other property and property set in that stream is kept as it was.
//
// Each function asks ut::sdk::CheckHostFault first, under its own name.
#pragma once

#include <ut/platform/bitmap.h>
#include <ut/platform/storage.h>
#include <ut/sdk/export.h>
#include <ut/sdk/image.h>

// {6D2A1F50-8B3C-4E5D-A1F2-3C4D5E6F7081}
inline constexpr CLSID CLSID_GWSceneViewer = {
    0x6D2A1F50, 0x8B3C, 0x4E5D, {0xA1, 0xF2, 0x3C, 0x4D, 0x5E, 0x6F, 0x70, 0x81}};
// {6D2A1F51-8B3C-4E5D-A1F2-3C4D5E6F7081}
inline constexpr IID IID_IGWSceneViewer = {
    0x6D2A1F51, 0x8B3C, 0x4E5D, {0xA1, 0xF2, 0x3C, 0x4D, 0x5E, 0x6F, 0x70, 0x81}};
// {6D2A1F52-8B3C-4E5D-A1F2-3C4D5E6F7081}
inline constexpr CLSID CLSID_GWPictureSource = {
    0x6D2A1F52, 0x8B3C, 0x4E5D, {0xA1, 0xF2, 0x3C, 0x4D, 0x5E, 0x6F, 0x70, 0x81}};
// {6D2A1F53-8B3C-4E5D-A1F2-3C4D5E6F7081}
inline constexpr IID IID_IGWPictureSource = {
    0x6D2A1F53, 0x8B3C, 0x4E5D, {0xA1, 0xF2, 0x3C, 0x4D, 0x5E, 0x6F, 0x70, 0x81}};
// {F29F85E0-4FF9-1068-AB91-08002B27B3D9}: the summary information property set.
inline constexpr GUID GUID_GWSummaryInformation = {
    0xF29F85E0, 0x4FF9, 0x1068, {0xAB, 0x91, 0x08, 0x00, 0x2B, 0x27, 0xB3, 0xD9}};
inline constexpr wchar_t kGWSummaryInformationStream[] = L"\005SummaryInformation";
inline constexpr ULONG GWPROPERTY_THUMBNAIL = 17;

// The application's viewer of the scene; its presence says there is a picture to take.
struct IGWSceneViewer : IUnknown {
protected:
    ~IGWSceneViewer() = default;
};

struct IGWPictureSource : IUnknown {
    // The picture `index` (0: the current one); E_INVALIDARG past the last.
    virtual HRESULT STDMETHODCALLTYPE GetImage(ULONG index, IGWImage** image) = 0;

protected:
    ~IGWPictureSource() = default;
};

template <>
struct ut::InterfaceId<IGWSceneViewer> : ut::Iid<IID_IGWSceneViewer> {};
template <>
struct ut::InterfaceId<IGWPictureSource> : ut::Iid<IID_IGWPictureSource> {};

// A new image of `format`, `width` by `height`, with the pixels of `bitmap` (which must be of that
// size: E_INVALIDARG otherwise). The bitmap stays the caller's.
UT_SDK_API HRESULT GWGetGwImageFromThumbnail(HBITMAP bitmap, ULONG width, ULONG height, REFGUID format,
                                             IGWImage** image);
// Writes `image` as the thumbnail of `storage` and commits the storage. The image is stored opaque
// (alpha dropped). A summary stream that is not a well-formed property set is refused with
// STG_E_INVALIDHEADER and nothing is written; storage failures pass through.
UT_SDK_API HRESULT GWSetThumbnail(IGWImage* image, IStorage* storage);
// The thumbnail of `storage` as an opaque image of the 4-byte colour format: S_OK, or S_FALSE with
// a null image when there is none. STG_E_INVALIDHEADER for a damaged property set or bitmap,
// E_NOTIMPL for a thumbnail in another form than a 24- or 32-bit uncompressed bitmap.
UT_SDK_API HRESULT GWGetThumbnail(IStorage* storage, IGWImage** image);
