// The reference host's images and its BMP reader.
#include "image_loader.h"

#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <new>
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/detail/little_endian.h>
#include <ut/sdk/testing.h>

#include "image_library.h"

namespace ut::host {
namespace {

using ut::platform::ReadLittleEndian;

// An uncompressed BMP of 8 (grey), 24 or 32 bits per pixel, rows turned top first.
HRESULT DecodeBmp(const std::vector<std::uint8_t>& file, ULONG& width, ULONG& height, GUID& format,
                  std::vector<std::uint8_t>& pixels) {
    if (file.size() < 54 || file[0] != 'B' || file[1] != 'M')
        return E_INVALIDARG;
    std::uint32_t offset = ReadLittleEndian(file, 10, 4), header = ReadLittleEndian(file, 14, 4),
                  bits = ReadLittleEndian(file, 28, 2);
    auto rawWidth = static_cast<std::int32_t>(ReadLittleEndian(file, 18, 4)),
         rawHeight = static_cast<std::int32_t>(ReadLittleEndian(file, 22, 4));
    if (header < 40 || ReadLittleEndian(file, 30, 4) != 0 || (bits != 8 && bits != 24 && bits != 32) ||
        rawWidth <= 0 || rawHeight == 0 || rawWidth > 1 << 15 || rawHeight > 1 << 15 ||
        rawHeight < -(1 << 15))
        return E_INVALIDARG;
    width = static_cast<ULONG>(rawWidth);
    height = static_cast<ULONG>(rawHeight < 0 ? -rawHeight : rawHeight);
    std::size_t stride = (width * bits / 8 + 3) / 4 * 4;
    if (offset > file.size() || file.size() - offset < stride * height)
        return E_INVALIDARG;
    format = bits == 8 ? GWPIXELFORMAT_GREY8 : GWPIXELFORMAT_RGBA32;
    std::size_t out = GWPixelFormatSize(format);
    pixels.assign(std::size_t{width} * height * out, 0);
    for (ULONG y = 0; y < height; ++y) {
        const std::uint8_t* row = file.data() + offset + stride * (rawHeight < 0 ? y : height - 1 - y);
        std::uint8_t* target = pixels.data() + std::size_t{y} * width * out;
        for (ULONG x = 0; x < width; ++x, target += out) {
            const std::uint8_t* p = row + x * bits / 8;
            if (bits == 8) {
                target[0] = p[0];
                continue;
            }
            target[0] = p[2];
            target[1] = p[1];
            target[2] = p[0];
            target[3] = bits == 32 ? p[3] : 255;
        }
    }
    return S_OK;
}

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> ImageLoader::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<ImageLoader, IGWImageLoader>(IID_IGWImageLoader)};
    return map;
}

HRESULT ImageLoader::LoadFile(const wchar_t* path, IGWImage** image) {
    if (!path || !image)
        return E_POINTER;
    *image = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWImageLoader::LoadFile"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        std::ifstream in(std::filesystem::path(path), std::ios::binary);
        if (!in)
            return STG_E_FILENOTFOUND;
        std::vector<std::uint8_t> file((std::istreambuf_iterator<char>(in)),
                                       std::istreambuf_iterator<char>());
        ULONG width = 0, height = 0;
        GUID format{};
        std::vector<std::uint8_t> pixels;
        if (HRESULT hr = DecodeBmp(file, width, height, format, pixels); FAILED(hr))
            return hr;
        *image = new Image(width, height, format, std::move(pixels));
        return S_OK;
    });
}

HRESULT ImageLoader::CreateImage(ULONG width, ULONG height, REFGUID format, const void* pixels,
                                 IGWImage** image) {
    if (!image || (!pixels && width && height))
        return E_POINTER;
    *image = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWImageLoader::CreateImage"); FAILED(hr))
        return hr;
    std::size_t size = GWPixelFormatSize(format);
    if (!size)
        size = 4; // a format the host does not know keeps 4 bytes a pixel
    return ExportBoundary([&] {
        std::vector<std::uint8_t> copy(std::size_t{width} * height * size);
        if (!copy.empty())
            std::memcpy(copy.data(), pixels, copy.size());
        *image = new Image(width, height, format, std::move(copy));
        return S_OK;
    });
}

} // namespace ut::host
