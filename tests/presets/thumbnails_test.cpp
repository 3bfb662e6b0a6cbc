// Thumbnails of the scene: the fit into 64 x 64 checked pixel by pixel, through the device bitmap
// and back out of a scene file; no picture; other summary properties kept; damaged summaries
// refused; the image library's sampling; and every host call failed in turn.
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <iostream>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/paths.h>
#include <ut/presets.h>
#include <ut/sdk/thumbnails.h>

#include "scene/test_scene.h"
#include "support/compound.h"
#include "support/fault_plan.h"
#include "support/temp_folder.h"
#include "support/wine.h"

namespace {

using ut::ComPtr;
using Pixels = std::vector<std::uint32_t>; // 0xAARRGGBB, rows top first

// The name of a result, the storage ones included.
std::string Result(HRESULT hr) {
    const std::pair<HRESULT, const char*> names[] = {
        {STG_E_INVALIDHEADER, "BADHEADER"},       {STG_E_FILENOTFOUND, "NOTFOUND"},
        {STG_E_FILEALREADYEXISTS, "NOTCOMPOUND"}, {E_NOTIMPL, "E_NOTIMPL"},
        {CLASS_E_NOAGGREGATION, "NOAGGREGATION"}, {REGDB_E_CLASSNOTREG, "CLASSNOTREG"}};
    for (auto [value, name] : names)
        if (hr == value)
            return name;
    return ut::test::Result(hr);
}
// A recognisable colour for each source pixel.
std::uint32_t Source(int x, int y) {
    return 0xFF000000u | std::uint32_t((x * 5 + y) & 255) << 16 | std::uint32_t((y * 3) & 255) << 8 |
           std::uint32_t((x * y) & 255);
}

// A 32-bit BMP of Source(), rows top first.
std::string Bmp(int width, int height) {
    std::string out = "BM";
    auto put = [&out](std::uint32_t value, int size) {
        for (int i = 0; i < size; ++i)
            out.push_back(char(value >> (8 * i)));
    };
    put(54 + width * height * 4, 4), put(0, 4), put(54, 4), put(40, 4), put(width, 4), put(-height, 4);
    put(1, 2), put(32, 2), put(0, 4), put(width * height * 4, 4), put(0, 4), put(0, 4), put(0, 4), put(0, 4);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            put(Source(x, y), 4);
    return out;
}

Pixels BitmapPixels(HBITMAP bitmap) {
    ut::platform::BitmapPixels read;
    EXPECT_EQ(ut::platform::ReadBitmapPixels(bitmap, read), S_OK);
    EXPECT_EQ(read.width * read.height, 64 * 64);
    return read.pixels;
}

Pixels ImagePixels(IGWImage* image) {
    ULONG width = 0, height = 0;
    void* bytes = nullptr;
    EXPECT_EQ(image->GetSize(&width, &height), S_OK);
    EXPECT_EQ(image->GetPixels(&bytes), S_OK);
    Pixels pixels(std::size_t{width} * height);
    for (std::size_t i = 0; i < pixels.size(); ++i) {
        const auto* p = static_cast<const std::uint8_t*>(bytes) + 4 * i;
        pixels[i] = std::uint32_t(p[3]) << 24 | std::uint32_t(p[0]) << 16 | std::uint32_t(p[1]) << 8 | p[2];
    }
    return pixels;
}

std::wstring NewSceneFile(const ut::test::TempFolder& folder, const std::string& summary = {}) {
    std::wstring path = folder / L"scene.scn";
    std::filesystem::remove(path);
    ComPtr<IStorage> storage;
    ComPtr<ILockBytes> bytes;
    EXPECT_EQ(F3DOpenStorageOnFile(path.c_str(), ut::test::kCreateMode, 1, storage.Put(), bytes.Put()), S_OK);
    EXPECT_EQ(ut::test::PutStream(storage.Get(), L"Contents", "scene"), S_OK);
    if (!summary.empty()) {
        EXPECT_EQ(ut::test::PutStream(storage.Get(), kGWSummaryInformationStream, summary), S_OK);
    }
    EXPECT_EQ(storage->Commit(STGC_DEFAULT), S_OK);
    return path;
}

// What GWGetThumbnail reads from the file, and the raw summary stream.
HRESULT ReadBack(const std::wstring& path, Pixels& pixels, std::string* summary = nullptr) {
    ComPtr<IStorage> storage;
    ComPtr<ILockBytes> bytes;
    ComPtr<IGWImage> image;
    EXPECT_EQ(F3DOpenStorageOnFile(path.c_str(), ut::test::kReadMode, 0, storage.Put(), bytes.Put()), S_OK);
    HRESULT hr = GWGetThumbnail(storage.Get(), image.Put());
    if (image)
        pixels = ImagePixels(image.Get());
    if (summary)
        *summary = ut::test::ReadStream(storage.Get(), kGWSummaryInformationStream);
    return hr;
}

// A property set stream of the summary set (and `extraSets` empty ones of other formats) with the
// given (identifier, type and value) properties, laid out as a writer outside this library would.
std::string SummaryStream(const std::vector<std::pair<std::uint32_t, std::string>>& properties,
                          int extraSets = 0) {
    auto le = [](std::uint32_t value) {
        return std::string{char(value), char(value >> 8), char(value >> 16), char(value >> 24)};
    };
    const std::string fmtid("\xE0\x85\x9F\xF2\xF9\x4F\x68\x10\xAB\x91\x08\x00\x2B\x27\xB3\xD9", 16);
    std::string set = le(0) + le(std::uint32_t(properties.size())), values;
    std::uint32_t header = 8 + 8 * std::uint32_t(properties.size());
    for (const auto& [id, value] : properties) {
        set += le(id) + le(header + std::uint32_t(values.size()));
        values += value + std::string((4 - value.size() % 4) % 4, '\0');
    }
    set = le(std::uint32_t(set.size() + values.size())) + set.substr(4) + values;
    int sets = 1 + extraSets;
    std::string out = std::string("\xFE\xFF\0\0\x05\x01\x02\0", 8) + std::string(16, '\0') + le(sets);
    std::string other = le(8) + le(0);
    out += fmtid + le(28 + 20 * sets);
    for (int i = 0; i < extraSets; ++i)
        out += std::string(16, char(0x40 + i)) + le(std::uint32_t(28 + 20 * sets + set.size() + 8 * i));
    out += set;
    for (int i = 0; i < extraSets; ++i)
        out += other;
    return out;
}

const std::string kTitle = std::string("\x1E\0\0\0\x08\0\0\0Shot 10\0", 16); // VT_LPSTR "Shot 10"
const std::string kCodePage = std::string("\x02\0\0\0\xE4\x04\0\0", 8);      // VT_I2 1252

// Each picture fitted into 64 x 64: the bitmap checked pixel by pixel against the source by the
// rule that applies, then the same picture put into a scene file and read back unchanged but for
// its alpha (the file keeps the picture opaque).
TEST(Thumbnails, FitsThePictureAndReadsItBackFromTheSceneFile) {
    enum Rule { kCopy, kHalf, kCovered, kUpscale };
    struct Case {
        int width, height, coveredWidth, coveredHeight;
        Rule rule;
    } cases[] = {
        {64, 64, 64, 64, kCopy},   {128, 32, 64, 16, kHalf},     {32, 128, 16, 64, kHalf},
        {128, 128, 64, 64, kHalf}, {200, 100, 64, 32, kCovered}, {10, 10, 64, 64, kUpscale},
        {1, 300, 0, 64, kCovered}, // thinner than a thumbnail pixel: nothing shows
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::to_string(c.width) + "x" + std::to_string(c.height));
        ut::test::TempFolder folder;
        ut::host::ReferenceHost host(
            ut::host::Settings{.thumbnailImage = folder.Write(L"p.bmp", Bmp(c.width, c.height))});
        HBITMAP bitmap = nullptr;
        ASSERT_EQ(KXGetThumbnail(&bitmap), S_OK);
        Pixels pixels = BitmapPixels(bitmap);
        EXPECT_TRUE(DeleteObject(bitmap));
        for (int y = 0; y < 64; ++y)
            for (int x = 0; x < 64; ++x) {
                std::uint32_t got = pixels[std::size_t(y * 64 + x)], want = got;
                if (x >= c.coveredWidth || y >= c.coveredHeight)
                    want = 0; // what a new image holds: transparent black
                else if (c.rule == kCopy)
                    want = Source(x, y);
                else if (c.rule == kHalf) { // the rounded mean of each 2 x 2 block, channel by channel
                    want = 0;
                    for (int shift = 0; shift < 32; shift += 8) {
                        std::uint32_t sum = 2;
                        for (int i = 0; i < 4; ++i)
                            sum += Source(2 * x + i % 2, 2 * y + i / 2) >> shift & 255;
                        want |= (sum / 4) << shift;
                    }
                } else if (c.rule == kUpscale && (x == 0 || x == 63) && (y == 0 || y == 63)) {
                    want = Source(x ? c.width - 1 : 0, y ? c.height - 1 : 0); // corners land on corners
                } else {
                    ASSERT_EQ(got >> 24, 255u) << "covered, so opaque, at " << x << "," << y;
                }
                ASSERT_EQ(got, want) << "at " << x << "," << y;
            }
        std::wstring scene = NewSceneFile(folder);
        ASSERT_EQ(KXPutThumnailInFile(CKXString(scene.c_str())), S_OK);
        Pixels back;
        ASSERT_EQ(ReadBack(scene, back), S_OK);
        for (std::size_t i = 0; i < pixels.size(); ++i)
            ASSERT_EQ(back[i], pixels[i] | 0xFF000000u) << "at " << i % 64 << "," << i / 64;
    }
}

TEST(Thumbnails, WithoutAPictureThereIsNoThumbnailAndTheFileIsNotOpened) {
    ut::test::TempFolder folder;
    const std::wstring image = folder.Write(L"p.bmp", Bmp(4, 4)), notAnImage = folder.Write(L"x.bmp", "BMx");
    struct Case {
        ut::host::Settings settings;
        int available;
        std::string get, put;
    } cases[] = {
        {{}, 0, "E_FAIL", "S_FALSE"},
        // A picture that is missing or no image: a viewer with nothing to show.
        {{.thumbnailImage = folder / L"missing.bmp"}, 1, "E_FAIL", "S_FALSE"},
        {{.thumbnailImage = notAnImage}, 1, "E_FAIL", "S_FALSE"},
        {{.thumbnailImage = image}, 1, "S_OK", "S_OK"},
        {ut::test::TestScene(), 0, "E_FAIL", "S_FALSE"},
        {{.scene = ut::test::TestScene().scene, .thumbnailRender = true}, 1, "S_OK", "S_OK"},
    };
    const std::wstring notCompound = folder.Write(L"plain.scn", "not a compound file");
    const std::string refused =
        ut::test::UnderWine("wine takes a file that is not compound for a missing one") ? "NOTFOUND"
                                                                                        : "NOTCOMPOUND";
    for (const Case& c : cases) {
        SCOPED_TRACE("row " + std::to_string(&c - cases));
        ut::host::ReferenceHost host(c.settings);
        int available = -1;
        HBITMAP bitmap = reinterpret_cast<HBITMAP>(&available);
        EXPECT_EQ(KXIsThumbnailAvaiable(&available), S_OK);
        EXPECT_EQ(available, c.available);
        EXPECT_EQ(Result(KXGetThumbnail(&bitmap)), c.get);
        EXPECT_EQ(bitmap != nullptr, c.get == "S_OK");
        if (bitmap) {
            EXPECT_TRUE(DeleteObject(bitmap));
        }
        auto before = std::filesystem::last_write_time(notCompound);
        EXPECT_EQ(Result(KXPutThumnailInFile(CKXString(notCompound.c_str()))),
                  c.put == "S_OK" ? refused : c.put);
        EXPECT_EQ(ut::test::FileContent(notCompound), "not a compound file");
        EXPECT_EQ(std::filesystem::last_write_time(notCompound), before);
        EXPECT_EQ(Result(KXPutThumnailInFile(CKXString((folder / L"none.scn").c_str()))),
                  c.put == "S_OK" ? "NOTFOUND" : c.put);
        EXPECT_FALSE(std::filesystem::exists(folder / L"none.scn"));
    }
}

// The other properties and property sets of the summary stream survive, and a second thumbnail
// replaces the first instead of adding to it.
TEST(Thumbnails, KeepsEveryOtherSummaryPropertyAndReplacesTheThumbnail) {
    ut::test::TempFolder folder;
    ut::host::ReferenceHost host(ut::host::Settings{.thumbnailImage = folder.Write(L"p.bmp", Bmp(8, 4))});
    const std::string odd("\x41\0\0\0\x03\0\0\0abc", 11); // a blob of 3 bytes, not 4-aligned
    for (int extraSets : {0, 1}) {
        std::wstring scene =
            NewSceneFile(folder, SummaryStream({{1, kCodePage}, {2, kTitle}, {0x1000, odd}}, extraSets));
        std::string first, second;
        Pixels pixels;
        ASSERT_EQ(KXPutThumnailInFile(CKXString(scene.c_str())), S_OK);
        ASSERT_EQ(ReadBack(scene, pixels, &first), S_OK);
        ASSERT_EQ(KXPutThumnailInFile(CKXString(scene.c_str())), S_OK);
        ASSERT_EQ(ReadBack(scene, pixels, &second), S_OK);
        EXPECT_EQ(first, second);
        for (const std::string& kept : {kCodePage, kTitle, odd})
            EXPECT_NE(first.find(kept), std::string::npos);
        EXPECT_EQ(first.find(std::string(16, '\x40')) != std::string::npos, extraSets == 1); // the other set
        EXPECT_EQ(first.substr(24, 4), (std::string{char(1 + extraSets), 0, 0, 0}));
    }
}

TEST(Thumbnails, RefusesADamagedSummaryAndWritesNothing) {
    ut::test::TempFolder folder;
    ut::host::ReferenceHost host(ut::host::Settings{.thumbnailImage = folder.Write(L"p.bmp", Bmp(8, 4))});
    const std::string good = SummaryStream({{1, kCodePage}, {2, kTitle}});
    auto patched = [&good](std::size_t at, std::string bytes) {
        return std::string(good).replace(at, bytes.size(), bytes);
    };
    auto thumbnail = [](std::string value) { return SummaryStream({{17, value}}); };
    // A clipboard value of `size` bytes in clipboard format `format`, followed by `rest`.
    auto clip = [&](char size, char format, const std::string& rest) {
        return thumbnail(std::string("\x47\0\0\0", 4) + size + std::string("\0\0\0\xFF\xFF\xFF\xFF", 7) +
                         format + std::string(3, '\0') + rest);
    };
    const std::string dib =
        std::string("\x28\0\0\0\x01\0\0\0\x01\0\0\0\x01\0\x18\0", 16) + std::string(24, '\0');
    struct Case {
        const char* what;
        std::string summary;
        std::string put, get;
    } cases[] = {
        {"no summary stream", "", "S_OK", "S_FALSE"},
        {"cut short", good.substr(0, 20), "BADHEADER", "BADHEADER"},
        {"byte order", patched(0, "\xFF\xFE"), "BADHEADER", "BADHEADER"},
        {"no set", patched(24, std::string(4, '\0')), "BADHEADER", "BADHEADER"},
        {"set past the end", patched(44, "\xFF\0\0\0"), "BADHEADER", "BADHEADER"},
        {"set larger than the stream", patched(48, "\xFF\xFF\0\0"), "BADHEADER", "BADHEADER"},
        {"too many properties", patched(52, "\xFF\xFF\xFF\x0F"), "BADHEADER", "BADHEADER"},
        {"value past the set", patched(60, "\xFF\0\0\0"), "BADHEADER", "BADHEADER"},
        {"two values at one place", patched(68, good.substr(60, 4)), "BADHEADER", "BADHEADER"},
        {"one identifier twice", patched(64, "\x01\0\0\0"), "BADHEADER", "BADHEADER"},
        {"another property set", patched(28, "\x01"), "BADHEADER", "S_FALSE"},
        {"no thumbnail", good, "S_OK", "S_FALSE"},
        {"a thumbnail not in a clipboard value", thumbnail(kTitle), "S_OK", "E_NOTIMPL"},
        {"a metafile", clip('\x08', '\x03', ""), "S_OK", "E_NOTIMPL"},
        {"a clipboard size past the value", clip('\x40', '\x08', ""), "S_OK", "BADHEADER"},
        {"a bitmap cut short", clip('\x10', '\x08', dib.substr(0, 8)), "S_OK", "BADHEADER"},
        {"a bitmap without its rows", clip('\x30', '\x08', dib), "S_OK", "BADHEADER"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        std::wstring scene = NewSceneFile(folder, c.summary);
        Pixels pixels;
        std::string before;
        if (!c.summary.empty()) {
            EXPECT_EQ(Result(ReadBack(scene, pixels, &before)), c.get);
        }
        HRESULT put = KXPutThumnailInFile(CKXString(scene.c_str()));
        std::string after;
        EXPECT_EQ(Result(ReadBack(scene, pixels, &after)), SUCCEEDED(put) ? "S_OK" : c.get);
        EXPECT_EQ(Result(put), c.put);
        EXPECT_EQ(after == before, FAILED(put));
    }
}

// kxILScaleTranslateImage on a 2 x 1 source of reds 0 and 200 (or greys) into a 4 x 2 target
// filled with 0x11 bytes: which pixels are written, and with what.
TEST(Thumbnails, ScalesAndTranslatesBySamplingPixelCentres) {
    ut::host::ReferenceHost host;
    auto make = [](ULONG width, ULONG height, const GUID& format, std::uint8_t fill) {
        ComPtr<IGWImage> image;
        ComPtr<IGWImageSetup> setup;
        void* pixels = nullptr;
        EXPECT_EQ(kxILCreateImage(nullptr, CLSID_GWImage, image.Put()), S_OK);
        EXPECT_EQ(image.As(setup), S_OK);
        EXPECT_EQ(setup->SetPixelFormat(format), S_OK);
        EXPECT_EQ(setup->SetSize(width, height), S_OK);
        EXPECT_EQ(image->GetPixels(&pixels), S_OK);
        std::fill_n(static_cast<std::uint8_t*>(pixels),
                    width * height * (format == GWPIXELFORMAT_GREY8 ? 1 : 4), fill);
        return std::pair(image, static_cast<std::uint8_t*>(pixels));
    };
    constexpr int _ = -1; // left as it was
    struct Case {
        bool grey;
        double scaleX, scaleY, translateX, translateY;
        int interpolation;
        int red[8];
    } cases[] = {
        {false, 2, 1, 0, 0, 0, {0, 0, 200, 200, _, _, _, _}},
        {false, 2, 1, 0, 0, 3, {0, 50, 150, 200, _, _, _, _}}, // the edges repeated outward
        {true, 2, 2, 0, 0, 3, {0, 50, 150, 200, 0, 50, 150, 200}},
        {false, 1, 1, 1, 1, 3, {_, _, _, _, _, 0, 200, _}},
        {false, 0.5, 1, 0, 0, 3, {100, _, _, _, _, _, _, _}},
        {false, 1.5, 1, -1, 0, 0, {200, 200, _, _, _, _, _, _}},
    };
    for (const Case& c : cases) {
        auto [source, from] = make(2, 1, c.grey ? GWPIXELFORMAT_GREY8 : GWPIXELFORMAT_RGBA32, 255);
        from[0] = 0;
        from[c.grey ? 1 : 4] = 200;
        if (!c.grey)
            from[1] = from[2] = from[5] = from[6] = 0;
        auto [target, to] = make(4, 2, GWPIXELFORMAT_RGBA32, 0x11);
        ASSERT_EQ(kxILScaleTranslateImage(source.Get(), target.Get(), c.scaleX, c.scaleY, c.translateX,
                                          c.translateY, c.interpolation),
                  S_OK);
        for (int i = 0; i < 8; ++i) {
            int red = c.red[i], other = c.grey ? red : 0;
            const std::uint8_t* p = to + 4 * i;
            std::vector<int> want = {red, other, other, 255};
            if (red == _)
                want.assign(4, 0x11);
            EXPECT_EQ(std::vector<int>(p, p + 4), want) << "pixel " << i << " of case " << &c - cases;
        }
    }
}

TEST(Thumbnails, ChecksPointersAndArguments) {
    ut::host::ReferenceHost host;
    ComPtr<IStorage> storage;
    ComPtr<ILockBytes> bytes;
    ComPtr<IGWImage> empty, image, out;
    ComPtr<IGWImageSetup> setup;
    ASSERT_EQ(F3DOpenStorageOnFile(nullptr, ut::test::kCreateMode, 1, storage.Put(), bytes.Put()), S_OK);
    ASSERT_EQ(kxILCreateImage(nullptr, CLSID_GWImage, empty.Put()), S_OK);
    ASSERT_EQ(kxILCreateImage(nullptr, CLSID_GWImage, image.Put()), S_OK);
    ASSERT_EQ(image.As(setup), S_OK);
    ASSERT_EQ(setup->SetSize(4, 2), S_OK);
    HBITMAP bitmap = nullptr, none = nullptr;
    ASSERT_EQ(KXImageHlp::CreateBitmapFromImage(image.Get(), &bitmap), S_OK);
    const double nan = std::nan("");
    // clang-format off
    const std::pair<HRESULT, std::string> cases[] = {
        {KXIsThumbnailAvaiable(nullptr), "E_POINTER"}, {KXGetThumbnail(nullptr), "E_POINTER"},
        {GWSetThumbnail(nullptr, storage.Get()), "E_POINTER"}, {GWSetThumbnail(image.Get(), nullptr), "E_POINTER"},
        {GWSetThumbnail(empty.Get(), storage.Get()), "E_INVALIDARG"},
        {GWGetThumbnail(nullptr, out.Put()), "E_POINTER"}, {GWGetThumbnail(storage.Get(), nullptr), "E_POINTER"},
        {GWGetThumbnail(storage.Get(), out.Put()), "S_FALSE"},
        {GWGetGwImageFromThumbnail(nullptr, 4, 2, GWPIXELFORMAT_RGBA32, out.Put()), "E_INVALIDARG"},
        {GWGetGwImageFromThumbnail(bitmap, 64, 64, GWPIXELFORMAT_RGBA32, out.Put()), "E_INVALIDARG"},
        {GWGetGwImageFromThumbnail(bitmap, 4, 2, GWPIXELFORMAT_RGBA32, nullptr), "E_POINTER"},
        {GWGetGwImageFromThumbnail(bitmap, 4, 2, GUID_NULL, out.Put()), "E_INVALIDARG"},
        {kxILCreateImage(image.Get(), CLSID_GWImage, out.Put()), "NOAGGREGATION"},
        {kxILCreateImage(nullptr, GUID_NULL, out.Put()), "CLASSNOTREG"},
        {kxILCreateImage(nullptr, CLSID_GWImage, nullptr), "E_POINTER"},
        {kxILScaleTranslateImage(nullptr, image.Get(), 1, 1, 0, 0, 3), "E_POINTER"},
        {kxILScaleTranslateImage(image.Get(), image.Get(), 0, 1, 0, 0, 3), "E_INVALIDARG"},
        {kxILScaleTranslateImage(image.Get(), image.Get(), 1, nan, 0, 0, 3), "E_INVALIDARG"},
        {kxILScaleTranslateImage(image.Get(), image.Get(), 1, 1, nan, 0, 3), "E_INVALIDARG"},
        {kxILScaleTranslateImage(image.Get(), image.Get(), 1, 1, 0, 0, 2), "E_INVALIDARG"},
        {KXImageHlp::CreateBitmapFromImage(empty.Get(), &none), "E_INVALIDARG"},
        {KXImageHlp::CreateBitmapFromImage(nullptr, &none), "E_POINTER"},
        {setup->SetPixelFormat(GUID_NULL), "E_INVALIDARG"}, {setup->SetSize(1u << 16, 1), "E_INVALIDARG"},
    };
    // clang-format on
    for (std::size_t i = 0; i < std::size(cases); ++i)
        EXPECT_EQ(Result(cases[i].first), cases[i].second) << "case " << i;
    EXPECT_FALSE(out);
    EXPECT_FALSE(none);
    EXPECT_TRUE(DeleteObject(bitmap));
}

// Each export with its 1st, 2nd, ... host call failing: a documented answer, no bitmap handed out
// on failure, the scene file untouched unless the thumbnail went in, and nothing left alive.
TEST(Thumbnails, EveryExportSurvivesEveryHostFault) {
    ut::test::TempFolder folder;
    ut::host::ReferenceHost host(ut::host::Settings{.thumbnailImage = folder.Write(L"p.bmp", Bmp(128, 32))});
    const std::wstring scene = NewSceneFile(folder, SummaryStream({{1, kCodePage}, {2, kTitle}}));
    const std::string original = ut::test::FileContent(scene);
    int available = -1;
    struct Walk {
        const char* name;
        std::function<HRESULT()> run;
        std::set<std::string> answers; // what a failing host call may give
        std::function<bool()> clean;   // what must hold after a failing run
    };
    // clang-format off
    const Walk walks[] = {
        {"available", [&] { return KXIsThumbnailAvaiable(&available); }, {"S_OK"}, [&] { return available == 0; }},
        {"get", [&] {
             HBITMAP bitmap = nullptr;
             HRESULT hr = KXGetThumbnail(&bitmap);
             if (bitmap && FAILED(hr))
                 return E_UNEXPECTED; // a bitmap handed out with a failure
             if (bitmap)
                 (void)DeleteObject(bitmap);
             return hr; },
         {"E_FAIL", "DENIED"}, [] { return true; }},
        {"put", [&] { folder.Write(L"scene.scn", original); return KXPutThumnailInFile(CKXString(scene.c_str())); },
         {"S_FALSE", "DENIED"}, [&] { return ut::test::FileContent(scene) == original; }},
    };
    // clang-format on
    int walked = 0;
    for (const Walk& walk : walks) {
        ut::test::WalkHostFaults([&] { return walk.run(); },
                                 [&](int row, HRESULT hr) {
                                     SCOPED_TRACE(std::string(walk.name) + " at call " + std::to_string(row));
                                     walked += row ? 1 : 0;
                                     EXPECT_TRUE(row ? walk.answers.count(Result(hr)) : hr == S_OK)
                                         << Result(hr);
                                     EXPECT_TRUE(!row || walk.clean());
                                 },
                                 E_ACCESSDENIED);
    }
    EXPECT_EQ(available, 1);
    EXPECT_NE(ut::test::FileContent(scene), original);
    std::cout << "[ walked   ] " << walked << " failure paths in " << std::size(walks) << " scenarios\n";
}

} // namespace
