// Device contexts and bitmaps on POSIX: 32-bit surfaces in memory, a screen that keeps no
// pixels, nearest-pixel stretching, and tables of live handles so that a stray handle is
// refused instead of followed.
#include <cstdlib>
#include <cstring>
#include <memory>
#include <mutex>
#include <new>
#include <set>

#include <ut/platform/bitmap.h>
#include <ut/platform/detail/boundary.h>

namespace {

constexpr DWORD ERROR_INVALID_WINDOW_HANDLE = 1400;
// The largest surface made here, in bytes: beyond it a request is taken for a mistake.
constexpr ULONGLONG kMaxSurfaceBytes = 1ull << 31;

struct Surface {
    LONG width = 0;
    LONG height = 0;
    bool topDown = true;
    std::uint32_t* pixels = nullptr;
    // The device context it is selected into; the stock bitmap is in every one that has it.
    HDC selectedIn = nullptr;
    bool stock = false;

    std::uint32_t* At(LONG x, LONG y) const {
        LONG row = topDown ? y : height - 1 - y;
        return pixels + static_cast<std::size_t>(row) * width + x;
    }
    bool Contains(LONG x, LONG y) const { return x >= 0 && y >= 0 && x < width && y < height; }
};

struct Context {
    bool screen = false;
    Surface* surface = nullptr;
    int stretchMode = BLACKONWHITE;
};

struct Gdi {
    std::mutex mutex;
    std::set<const void*> surfaces;
    std::set<const void*> contexts;
    std::uint32_t stockPixel = 0;
    Surface stock;

    Gdi() {
        stock.width = 1;
        stock.height = 1;
        stock.pixels = &stockPixel;
        stock.stock = true;
        surfaces.insert(&stock);
    }
};

// Never destroyed: handles may be deleted while the process exits.
Gdi& Objects() {
    static Gdi* gdi = new Gdi;
    return *gdi;
}

Surface* SurfaceOf(Gdi& gdi, const void* handle) {
    return gdi.surfaces.count(handle) ? static_cast<Surface*>(const_cast<void*>(handle)) : nullptr;
}

Context* ContextOf(Gdi& gdi, HDC handle) {
    if (gdi.contexts.count(handle))
        return reinterpret_cast<Context*>(handle);
    SetLastError(ERROR_INVALID_HANDLE);
    return nullptr;
}

HDC NewContext(Gdi& gdi, bool screen) {
    auto context = std::make_unique<Context>();
    context->screen = screen;
    context->surface = screen ? nullptr : &gdi.stock;
    auto handle = reinterpret_cast<HDC>(context.get());
    gdi.contexts.insert(handle);
    (void)context.release(); // the table owns it until DeleteDC
    return handle;
}

void DeleteContext(Gdi& gdi, HDC handle) {
    Context* context = reinterpret_cast<Context*>(handle);
    if (context->surface && !context->surface->stock)
        context->surface->selectedIn = nullptr;
    gdi.contexts.erase(handle);
    delete context;
}

HBITMAP NewSurface(Gdi& gdi, LONG width, LONG height, bool topDown) {
    ULONGLONG bytes = static_cast<ULONGLONG>(width) * static_cast<ULONGLONG>(height) * 4;
    if (bytes > kMaxSurfaceBytes) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    auto surface = std::make_unique<Surface>();
    surface->width = width;
    surface->height = height;
    surface->topDown = topDown;
    surface->pixels = static_cast<std::uint32_t*>(std::calloc(static_cast<std::size_t>(bytes), 1));
    if (!surface->pixels) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    gdi.surfaces.insert(surface.get());
    return reinterpret_cast<HBITMAP>(surface.release());
}

// The source index of destination index `i` out of `count`, sampling the middle of the
// destination pixel among `sourceCount` source pixels, and mirrored when asked.
LONG Sample(LONG i, LONG count, LONG sourceCount, bool mirrored) {
    LONG j = static_cast<LONG>((2 * static_cast<LONGLONG>(i) + 1) * sourceCount /
                               (2 * static_cast<LONGLONG>(count)));
    return mirrored ? sourceCount - 1 - j : j;
}

// A negative extent runs back from the origin: its pixels are origin + extent + 1 to origin.
bool Normalize(int& origin, int& extent) {
    if (extent >= 0)
        return false;
    origin += extent + 1;
    extent = -extent;
    return true;
}

void Stretch(const Surface* target, int x, int y, int width, int height, const Surface* source, int sx,
             int sy, int sourceWidth, int sourceHeight) {
    bool mirrorX = Normalize(x, width) != Normalize(sx, sourceWidth);
    bool mirrorY = Normalize(y, height) != Normalize(sy, sourceHeight);
    for (LONG row = 0; row < height; ++row) {
        LONG ty = y + row;
        LONG fy = sy + Sample(row, height, sourceHeight, mirrorY);
        for (LONG column = 0; column < width; ++column) {
            LONG tx = x + column;
            LONG fx = sx + Sample(column, width, sourceWidth, mirrorX);
            if (!target->Contains(tx, ty))
                continue;
            // The screen keeps no pixels: what comes from it is black.
            if (!source)
                *target->At(tx, ty) = 0;
            else if (source->Contains(fx, fy))
                *target->At(tx, ty) = *source->At(fx, fy);
        }
    }
}

} // namespace

extern "C" {

HDC GetDC(HWND window) {
    if (window) {
        SetLastError(ERROR_INVALID_WINDOW_HANDLE);
        return nullptr;
    }
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    return ut::ExportBoundary([&] { return NewContext(gdi, true); }, HDC{nullptr});
}

int ReleaseDC(HWND, HDC dc) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    Context* context = ContextOf(gdi, dc);
    if (!context || !context->screen)
        return 0;
    DeleteContext(gdi, dc);
    return 1;
}

HDC CreateCompatibleDC(HDC dc) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    if (dc && !ContextOf(gdi, dc))
        return nullptr;
    return ut::ExportBoundary([&] { return NewContext(gdi, false); }, HDC{nullptr});
}

BOOL DeleteDC(HDC dc) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    if (!ContextOf(gdi, dc))
        return FALSE;
    DeleteContext(gdi, dc);
    return TRUE;
}

HBITMAP CreateCompatibleBitmap(HDC dc, int width, int height) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    if (!ContextOf(gdi, dc))
        return nullptr;
    if (width < 0 || height < 0) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return nullptr;
    }
    if (width == 0 || height == 0)
        return reinterpret_cast<HBITMAP>(&gdi.stock);
    return ut::ExportBoundary([&] { return NewSurface(gdi, width, height, true); }, HBITMAP{nullptr});
}

HBITMAP CreateDIBSection(HDC dc, const BITMAPINFO* info, UINT usage, void** bits, HANDLE section, DWORD) {
    if (bits)
        *bits = nullptr;
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    if (dc && !ContextOf(gdi, dc))
        return nullptr;
    const BITMAPINFOHEADER* header = info ? &info->bmiHeader : nullptr;
    if (!header || header->biSize < sizeof(BITMAPINFOHEADER) || header->biWidth <= 0 ||
        header->biHeight == 0 || header->biHeight == LONG{-2147483647 - 1} || header->biPlanes != 1 ||
        header->biBitCount != 32 || header->biCompression != BI_RGB || usage != DIB_RGB_COLORS || section) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return nullptr;
    }
    LONG height = header->biHeight < 0 ? -header->biHeight : header->biHeight;
    HBITMAP bitmap = ut::ExportBoundary(
        [&] { return NewSurface(gdi, header->biWidth, height, header->biHeight < 0); }, HBITMAP{nullptr});
    if (bitmap && bits)
        *bits = reinterpret_cast<Surface*>(bitmap)->pixels;
    return bitmap;
}

HGDIOBJ SelectObject(HDC dc, HGDIOBJ object) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    Context* context = ContextOf(gdi, dc);
    Surface* surface = SurfaceOf(gdi, object);
    if (!context || !surface || context->screen) {
        SetLastError(ERROR_INVALID_HANDLE);
        return nullptr;
    }
    if (!surface->stock && surface->selectedIn && surface->selectedIn != dc)
        return nullptr;
    Surface* previous = context->surface;
    if (previous && !previous->stock)
        previous->selectedIn = nullptr;
    context->surface = surface;
    if (!surface->stock)
        surface->selectedIn = dc;
    return previous;
}

BOOL DeleteObject(HGDIOBJ object) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    Surface* surface = SurfaceOf(gdi, object);
    if (!surface) {
        SetLastError(ERROR_INVALID_HANDLE);
        return FALSE;
    }
    if (surface->stock)
        return TRUE;
    if (surface->selectedIn)
        return FALSE;
    gdi.surfaces.erase(surface);
    std::free(surface->pixels);
    delete surface;
    return TRUE;
}

int SetStretchBltMode(HDC dc, int mode) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    Context* context = ContextOf(gdi, dc);
    if (!context || mode < BLACKONWHITE || mode > HALFTONE) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return 0;
    }
    int previous = context->stretchMode;
    context->stretchMode = mode;
    return previous;
}

int GetStretchBltMode(HDC dc) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    Context* context = ContextOf(gdi, dc);
    return context ? context->stretchMode : 0;
}

BOOL StretchBlt(HDC target, int x, int y, int width, int height, HDC source, int sourceX, int sourceY,
                int sourceWidth, int sourceHeight, DWORD operation) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    Context* to = ContextOf(gdi, target);
    Context* from = ContextOf(gdi, source);
    if (!to || !from)
        return FALSE;
    if (operation != SRCCOPY) {
        SetLastError(ERROR_INVALID_PARAMETER);
        return FALSE;
    }
    if (to->screen || width == 0 || height == 0 || sourceWidth == 0 || sourceHeight == 0)
        return TRUE;
    Stretch(to->surface, x, y, width, height, from->screen ? nullptr : from->surface, sourceX, sourceY,
            sourceWidth, sourceHeight);
    return TRUE;
}

} // extern "C"

namespace ut::platform {

HRESULT ReadBitmapPixels(HBITMAP bitmap, BitmapPixels& out) {
    Gdi& gdi = Objects();
    std::lock_guard lock(gdi.mutex);
    Surface* surface = SurfaceOf(gdi, bitmap);
    if (!surface)
        return E_INVALIDARG;
    return ut::ExportBoundary([&] {
        out.width = surface->width;
        out.height = surface->height;
        out.pixels.resize(static_cast<std::size_t>(surface->width) * surface->height);
        for (LONG y = 0; y < surface->height; ++y)
            std::memcpy(&out.pixels[static_cast<std::size_t>(y) * surface->width], surface->At(0, y),
                        static_cast<std::size_t>(surface->width) * 4);
        return S_OK;
    });
}

} // namespace ut::platform
