// Writing a device bitmap as a BMP file, the same on both homes.
#include <cstdint>
#include <string>

#include <ut/platform/bitmap.h>
#include <ut/platform/detail/boundary.h>
#include <ut/platform/stream.h>

namespace ut::platform {
namespace {

constexpr std::uint32_t kFileHeaderSize = 14;
constexpr std::uint32_t kInfoHeaderSize = 40;
constexpr std::uint32_t kPixelsPerMetre = 2835; // 72 dots per inch

void Put16(std::string& out, std::uint32_t value) {
    out.push_back(static_cast<char>(value & 0xFF));
    out.push_back(static_cast<char>((value >> 8) & 0xFF));
}
void Put32(std::string& out, std::uint32_t value) {
    Put16(out, value & 0xFFFF);
    Put16(out, value >> 16);
}

// A 32-bit BMP: file header, information header, rows from the bottom up.
std::string EncodeBmp(const BitmapPixels& image) {
    auto width = static_cast<std::uint32_t>(image.width);
    auto height = static_cast<std::uint32_t>(image.height);
    std::uint32_t imageSize = width * height * 4;
    std::string out;
    out.reserve(kFileHeaderSize + kInfoHeaderSize + imageSize);
    out += "BM";
    Put32(out, kFileHeaderSize + kInfoHeaderSize + imageSize);
    Put32(out, 0);
    Put32(out, kFileHeaderSize + kInfoHeaderSize);
    for (std::uint32_t field : {kInfoHeaderSize, width, height})
        Put32(out, field);
    Put16(out, 1);
    Put16(out, 32);
    for (std::uint32_t field : {0u, imageSize, kPixelsPerMetre, kPixelsPerMetre, 0u, 0u})
        Put32(out, field);
    for (std::uint32_t row = height; row-- > 0;)
        for (std::uint32_t x = 0; x < width; ++x)
            Put32(out, image.pixels[static_cast<std::size_t>(row) * width + x]);
    return out;
}

} // namespace

HRESULT WriteBitmapFile(HBITMAP bitmap, const wchar_t* path) {
    return ut::ExportBoundary([&] {
        BitmapPixels image;
        if (HRESULT hr = ReadBitmapPixels(bitmap, image); FAILED(hr))
            return hr;
        std::string bytes = EncodeBmp(image);
        ComPtr<IStream> file;
        if (HRESULT hr = OpenFileStream(path, STGM_WRITE | STGM_CREATE, file.Put()); FAILED(hr))
            return hr;
        return file->Write(bytes.data(), static_cast<ULONG>(bytes.size()), nullptr);
    });
}

} // namespace ut::platform
