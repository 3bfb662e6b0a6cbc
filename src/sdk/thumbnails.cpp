// Thumbnails of compound files: a property set stream holding a device-independent bitmap, read
// and written without losing the other properties, and a device bitmap turned into an image.
#include <ut/sdk/thumbnails.h>

#include <algorithm>
#include <cstdint>
#include <set>
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/detail/little_endian.h>
#include <ut/sdk/testing.h>

#include "pixels.h"

namespace {

using ut::ComPtr;
using ut::platform::AppendLittleEndian;
using ut::platform::ReadLittleEndian;
using ut::sdk::ImageView;
using ut::sdk::Rgba;
using Bytes = std::vector<std::uint8_t>;

constexpr std::uint16_t kByteOrderMark = 0xFFFE;
constexpr std::size_t kStreamHeaderSize = 28; // byte order, version, system, class, set count
constexpr std::size_t kSetEntrySize = 20;     // format identifier and offset
constexpr std::size_t kMaxSets = 2;
constexpr std::uint32_t kTypeShort = 2;
constexpr std::uint32_t kTypeClipboard = 71;
constexpr std::uint32_t kCodePageProperty = 1;
constexpr std::uint32_t kCodePageUnicode = 1200;
constexpr std::uint32_t kSystemClipboardTag = 0xFFFFFFFF;
constexpr std::uint32_t kClipboardBitmap = 8;
// What a new stream says wrote it: 2 in the high word is the system kind the format knows.
constexpr std::uint32_t kSystemIdentifier = 0x00020006;
constexpr std::uint32_t kInfoHeaderSize = 40;
// Beyond these a stream or a thumbnail is taken for damage, not read into memory.
constexpr std::size_t kMaxStreamSize = 1 << 24;
constexpr std::int32_t kMaxThumbnailSide = 4096;

struct Property {
    std::uint32_t id;
    Bytes value; // the type word, its padding and the value, as stored
};

struct PropertySet {
    GUID fmtid = GUID_NULL;
    std::vector<Property> properties;
};

struct PropertyStream {
    std::uint32_t version = 0;
    std::uint32_t system = kSystemIdentifier;
    GUID clsid = GUID_NULL;
    std::vector<PropertySet> sets;
};

GUID GuidAt(const Bytes& bytes, std::size_t at) {
    GUID guid{ReadLittleEndian(bytes, at),
              static_cast<std::uint16_t>(ReadLittleEndian(bytes, at + 4, 2)),
              static_cast<std::uint16_t>(ReadLittleEndian(bytes, at + 6, 2)),
              {}};
    std::copy_n(bytes.begin() + static_cast<std::ptrdiff_t>(at + 8), 8, guid.Data4);
    return guid;
}

void PutGuid(Bytes& out, const GUID& guid) {
    AppendLittleEndian(out, guid.Data1);
    AppendLittleEndian(out, guid.Data2, 2);
    AppendLittleEndian(out, guid.Data3, 2);
    out.insert(out.end(), guid.Data4, guid.Data4 + 8);
}

void PadToFour(Bytes& out) {
    while (out.size() % 4)
        out.push_back(0);
}

// A property set at `at`: its size, its count, (identifier, offset) pairs, and values that run
// from their offset to the next one. Identifiers and offsets must be distinct and inside the set.
bool DecodeSet(const Bytes& bytes, std::size_t at, PropertySet& set) {
    if (at > bytes.size() || bytes.size() - at < 8)
        return false;
    std::uint32_t size = ReadLittleEndian(bytes, at), count = ReadLittleEndian(bytes, at + 4);
    if (size < 8 || size > bytes.size() - at || count > (size - 8) / 8)
        return false;
    std::vector<std::pair<std::uint32_t, std::uint32_t>> entries; // (offset, identifier)
    std::set<std::uint32_t> ids;
    for (std::uint32_t i = 0; i < count; ++i) {
        std::uint32_t id = ReadLittleEndian(bytes, at + 8 + 8 * i),
                      offset = ReadLittleEndian(bytes, at + 12 + 8 * i);
        if (offset < 8 + 8 * count || offset >= size || !ids.insert(id).second)
            return false;
        entries.emplace_back(offset, id);
    }
    std::vector<std::pair<std::uint32_t, std::uint32_t>> byOffset = entries;
    std::sort(byOffset.begin(), byOffset.end());
    for (const auto& [offset, id] : entries) {
        auto next = std::upper_bound(byOffset.begin(), byOffset.end(), std::pair(offset, id));
        std::uint32_t end = next == byOffset.end() ? size : next->first;
        if (end - offset < 4) // two values at one place, or no room for the type
            return false;
        auto begin = bytes.begin() + static_cast<std::ptrdiff_t>(at + offset);
        set.properties.push_back({id, Bytes(begin, begin + (end - offset))});
    }
    return true;
}

bool DecodeStream(const Bytes& bytes, PropertyStream& stream) {
    if (bytes.size() < kStreamHeaderSize || ReadLittleEndian(bytes, 0, 2) != kByteOrderMark ||
        ReadLittleEndian(bytes, 2, 2) > 1)
        return false;
    stream.version = ReadLittleEndian(bytes, 2, 2);
    stream.system = ReadLittleEndian(bytes, 4);
    stream.clsid = GuidAt(bytes, 8);
    std::uint32_t count = ReadLittleEndian(bytes, 24);
    if (count < 1 || count > kMaxSets || bytes.size() < kStreamHeaderSize + kSetEntrySize * count)
        return false;
    stream.sets.resize(count);
    for (std::uint32_t i = 0; i < count; ++i) {
        std::size_t entry = kStreamHeaderSize + kSetEntrySize * i;
        stream.sets[i].fmtid = GuidAt(bytes, entry);
        std::uint32_t offset = ReadLittleEndian(bytes, entry + 16);
        if (offset < kStreamHeaderSize + kSetEntrySize * count || !DecodeSet(bytes, offset, stream.sets[i]))
            return false;
    }
    return true;
}

Bytes EncodeSet(const PropertySet& set) {
    Bytes values;
    Bytes out;
    auto header = static_cast<std::uint32_t>(8 + 8 * set.properties.size());
    AppendLittleEndian(out, 0); // the size, known at the end
    AppendLittleEndian(out, static_cast<std::uint32_t>(set.properties.size()));
    for (const Property& property : set.properties) {
        AppendLittleEndian(out, property.id);
        AppendLittleEndian(out, header + static_cast<std::uint32_t>(values.size()));
        values.insert(values.end(), property.value.begin(), property.value.end());
        PadToFour(values);
    }
    out.insert(out.end(), values.begin(), values.end());
    auto size = static_cast<std::uint32_t>(out.size());
    for (int i = 0; i < 4; ++i)
        out[static_cast<std::size_t>(i)] = static_cast<std::uint8_t>(size >> (8 * i));
    return out;
}

Bytes EncodeStream(const PropertyStream& stream) {
    Bytes out;
    AppendLittleEndian(out, kByteOrderMark, 2);
    AppendLittleEndian(out, stream.version, 2);
    AppendLittleEndian(out, stream.system);
    PutGuid(out, stream.clsid);
    AppendLittleEndian(out, static_cast<std::uint32_t>(stream.sets.size()));
    std::vector<Bytes> sets;
    std::size_t offset = kStreamHeaderSize + kSetEntrySize * stream.sets.size();
    for (const PropertySet& set : stream.sets) {
        sets.push_back(EncodeSet(set));
        PutGuid(out, set.fmtid);
        AppendLittleEndian(out, static_cast<std::uint32_t>(offset));
        offset += sets.back().size();
    }
    for (const Bytes& set : sets)
        out.insert(out.end(), set.begin(), set.end());
    return out;
}

// The image as a packed bitmap: information header and 24-bit rows, bottom row first.
Bytes EncodeDib(const ImageView& image) {
    std::size_t stride = (std::size_t{image.width} * 3 + 3) / 4 * 4;
    auto imageSize = static_cast<std::uint32_t>(stride * image.height);
    Bytes out;
    out.reserve(kInfoHeaderSize + imageSize);
    for (std::uint32_t field : {kInfoHeaderSize, std::uint32_t{image.width}, std::uint32_t{image.height}})
        AppendLittleEndian(out, field);
    AppendLittleEndian(out, 1, 2);                              // planes
    AppendLittleEndian(out, 24, 2);                             // bits per pixel
    for (std::uint32_t field : {0u, imageSize, 0u, 0u, 0u, 0u}) // uncompressed, no colour table
        AppendLittleEndian(out, field);
    for (ULONG row = image.height; row-- > 0;) {
        for (ULONG x = 0; x < image.width; ++x) {
            Rgba p = image.Read(x, row);
            out.insert(out.end(), {p.b, p.g, p.r});
        }
        PadToFour(out);
    }
    return out;
}

// A packed bitmap of 24 or 32 bits a pixel, uncompressed, as an opaque 4-byte colour image.
HRESULT DecodeDib(const Bytes& dib, ComPtr<IGWImage>& image) {
    if (dib.size() < kInfoHeaderSize)
        return STG_E_INVALIDHEADER;
    std::uint32_t headerSize = ReadLittleEndian(dib, 0), bits = ReadLittleEndian(dib, 14, 2),
                  colours = ReadLittleEndian(dib, 32);
    auto width = static_cast<std::int32_t>(ReadLittleEndian(dib, 4)),
         height = static_cast<std::int32_t>(ReadLittleEndian(dib, 8));
    if (headerSize < kInfoHeaderSize || headerSize > dib.size() || ReadLittleEndian(dib, 12, 2) != 1 ||
        width < 1 || width > kMaxThumbnailSide || height == 0 || height > kMaxThumbnailSide ||
        height < -kMaxThumbnailSide || colours > 256)
        return STG_E_INVALIDHEADER;
    if ((bits != 24 && bits != 32) || ReadLittleEndian(dib, 16) != 0)
        return E_NOTIMPL;
    auto rows = static_cast<ULONG>(height < 0 ? -height : height);
    std::size_t stride = (std::size_t{static_cast<ULONG>(width)} * bits / 8 + 3) / 4 * 4;
    std::size_t pixels = std::size_t{headerSize} + std::size_t{colours} * 4;
    if (pixels > dib.size() || (dib.size() - pixels) / stride < rows)
        return STG_E_INVALIDHEADER;
    if (HRESULT hr = ut::sdk::CreateShapedImage(static_cast<ULONG>(width), rows, GWPIXELFORMAT_RGBA32, image);
        FAILED(hr))
        return hr;
    ImageView view;
    if (HRESULT hr = ut::sdk::ViewImage(image.Get(), view); FAILED(hr))
        return hr;
    for (ULONG y = 0; y < rows; ++y) {
        std::size_t row = pixels + stride * (height < 0 ? y : rows - 1 - y);
        for (ULONG x = 0; x < view.width; ++x) {
            std::size_t p = row + std::size_t{x} * bits / 8;
            view.Write(x, y, {dib[p + 2], dib[p + 1], dib[p], 255}); // a fourth byte is unused there
        }
    }
    return S_OK;
}

Bytes ThumbnailValue(const Bytes& dib) {
    Bytes value;
    AppendLittleEndian(value, kTypeClipboard);
    AppendLittleEndian(value, static_cast<std::uint32_t>(8 + dib.size()));
    AppendLittleEndian(value, kSystemClipboardTag);
    AppendLittleEndian(value, kClipboardBitmap);
    value.insert(value.end(), dib.begin(), dib.end());
    return value;
}

HRESULT DecodeThumbnail(const Bytes& value, ComPtr<IGWImage>& image) {
    if (value.size() < 8)
        return STG_E_INVALIDHEADER;
    if (ReadLittleEndian(value, 0, 2) != kTypeClipboard)
        return E_NOTIMPL;
    std::uint32_t size = ReadLittleEndian(value, 4);
    if (size < 8 || size > value.size() - 8)
        return STG_E_INVALIDHEADER;
    if (ReadLittleEndian(value, 8) != kSystemClipboardTag || ReadLittleEndian(value, 12) != kClipboardBitmap)
        return E_NOTIMPL;
    return DecodeDib(Bytes(value.begin() + 16, value.begin() + 8 + size), image);
}

// The whole summary stream of `storage`: S_FALSE when there is none.
HRESULT ReadSummary(IStorage& storage, Bytes& bytes) {
    ComPtr<IStream> stream;
    HRESULT hr = storage.OpenStream(kGWSummaryInformationStream, nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, 0,
                                    stream.Put());
    if (hr == STG_E_FILENOTFOUND)
        return S_FALSE;
    if (FAILED(hr))
        return hr;
    STATSTG stat{};
    if (hr = stream->Stat(&stat, STATFLAG_NONAME); FAILED(hr))
        return hr;
    if (stat.cbSize.QuadPart > kMaxStreamSize)
        return STG_E_INVALIDHEADER;
    bytes.resize(static_cast<std::size_t>(stat.cbSize.QuadPart));
    ULONG read = 0;
    if (!bytes.empty() && FAILED(hr = stream->Read(bytes.data(), static_cast<ULONG>(bytes.size()), &read)))
        return hr;
    bytes.resize(read);
    return S_OK;
}

HRESULT WriteSummary(IStorage& storage, const Bytes& bytes) {
    ComPtr<IStream> stream;
    HRESULT hr = storage.CreateStream(
        kGWSummaryInformationStream, STGM_CREATE | STGM_READWRITE | STGM_SHARE_EXCLUSIVE, 0, 0, stream.Put());
    if (FAILED(hr))
        return hr;
    ULONG written = 0;
    if (hr = stream->Write(bytes.data(), static_cast<ULONG>(bytes.size()), &written); FAILED(hr))
        return hr;
    return written == bytes.size() ? S_OK : STG_E_MEDIUMFULL;
}

PropertySet* SummarySet(PropertyStream& stream) {
    auto found = std::find_if(stream.sets.begin(), stream.sets.end(), [](const PropertySet& set) {
        return IsEqualGUID(set.fmtid, GUID_GWSummaryInformation);
    });
    return found == stream.sets.end() ? nullptr : &*found;
}

Property* FindProperty(PropertySet& set, std::uint32_t id) {
    auto found = std::find_if(set.properties.begin(), set.properties.end(),
                              [id](const Property& property) { return property.id == id; });
    return found == set.properties.end() ? nullptr : &*found;
}

// A summary stream of its own for a file that has none: a code page and nothing else yet.
PropertyStream NewSummary() {
    Bytes codePage;
    AppendLittleEndian(codePage, kTypeShort);
    AppendLittleEndian(codePage, kCodePageUnicode);
    PropertyStream stream;
    stream.sets.push_back({GUID_GWSummaryInformation, {{kCodePageProperty, codePage}}});
    return stream;
}

} // namespace

HRESULT GWGetGwImageFromThumbnail(HBITMAP bitmap, ULONG width, ULONG height, REFGUID format,
                                  IGWImage** image) {
    if (!image)
        return E_POINTER;
    *image = nullptr;
    if (!bitmap)
        return E_INVALIDARG;
    if (HRESULT hr = ut::sdk::CheckHostFault("GWGetGwImageFromThumbnail"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        ut::platform::BitmapPixels read;
        if (HRESULT hr = ut::platform::ReadBitmapPixels(bitmap, read); FAILED(hr))
            return hr;
        if (read.width < 0 || read.height < 0 || static_cast<ULONG>(read.width) != width ||
            static_cast<ULONG>(read.height) != height)
            return E_INVALIDARG;
        ComPtr<IGWImage> made;
        ImageView view;
        if (HRESULT hr = ut::sdk::CreateShapedImage(width, height, format, made); FAILED(hr))
            return hr;
        if (HRESULT hr = ut::sdk::ViewImage(made.Get(), view); FAILED(hr))
            return hr;
        for (ULONG y = 0; y < height; ++y)
            for (ULONG x = 0; x < width; ++x) {
                std::uint32_t p = read.pixels[std::size_t{y} * width + x];
                view.Write(x, y,
                           {static_cast<std::uint8_t>(p >> 16), static_cast<std::uint8_t>(p >> 8),
                            static_cast<std::uint8_t>(p), static_cast<std::uint8_t>(p >> 24)});
            }
        *image = made.Detach();
        return S_OK;
    });
}

HRESULT GWSetThumbnail(IGWImage* image, IStorage* storage) {
    if (!image || !storage)
        return E_POINTER;
    if (HRESULT hr = ut::sdk::CheckHostFault("GWSetThumbnail"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        ImageView view;
        if (HRESULT hr = ut::sdk::ViewImage(image, view); FAILED(hr))
            return hr;
        if (!view.width || !view.height || view.width > kMaxThumbnailSide || view.height > kMaxThumbnailSide)
            return E_INVALIDARG;
        Bytes existing;
        HRESULT hr = ReadSummary(*storage, existing);
        if (FAILED(hr))
            return hr;
        PropertyStream stream;
        if (hr == S_FALSE)
            stream = NewSummary();
        else if (!DecodeStream(existing, stream))
            return STG_E_INVALIDHEADER;
        PropertySet* summary = SummarySet(stream);
        if (!summary)
            return STG_E_INVALIDHEADER; // the stream is some other property set: not ours to replace
        Bytes value = ThumbnailValue(EncodeDib(view));
        if (Property* kept = FindProperty(*summary, GWPROPERTY_THUMBNAIL))
            kept->value = std::move(value);
        else
            summary->properties.push_back({GWPROPERTY_THUMBNAIL, std::move(value)});
        if (hr = WriteSummary(*storage, EncodeStream(stream)); FAILED(hr))
            return hr;
        return storage->Commit(STGC_DEFAULT);
    });
}

HRESULT GWGetThumbnail(IStorage* storage, IGWImage** image) {
    if (!storage || !image)
        return E_POINTER;
    *image = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("GWGetThumbnail"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        Bytes bytes;
        HRESULT hr = ReadSummary(*storage, bytes);
        if (hr != S_OK)
            return hr;
        PropertyStream stream;
        if (!DecodeStream(bytes, stream))
            return STG_E_INVALIDHEADER;
        PropertySet* summary = SummarySet(stream);
        const Property* thumbnail = summary ? FindProperty(*summary, GWPROPERTY_THUMBNAIL) : nullptr;
        if (!thumbnail)
            return S_FALSE;
        ComPtr<IGWImage> decoded;
        if (hr = DecodeThumbnail(thumbnail->value, decoded); FAILED(hr))
            return hr;
        *image = decoded.Detach();
        return S_OK;
    });
}
