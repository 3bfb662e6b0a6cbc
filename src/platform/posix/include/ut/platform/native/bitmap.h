// POSIX home: the part of the system's drawing interface that turns images into device bitmaps,
// with the Windows layout. Every surface here is 32 bits per pixel (blue, green, red, alpha).
#pragma once

#include <ut/platform/native/com.h>

struct HDC__;
using HDC = HDC__*;
struct HBITMAP__;
using HBITMAP = HBITMAP__*;
struct HWND__;
using HWND = HWND__*;
using HGDIOBJ = void*;

struct RECT {
    LONG left;
    LONG top;
    LONG right;
    LONG bottom;
};

struct RGBQUAD {
    BYTE rgbBlue;
    BYTE rgbGreen;
    BYTE rgbRed;
    BYTE rgbReserved;
};

struct BITMAPINFOHEADER {
    DWORD biSize;
    LONG biWidth;
    LONG biHeight;
    WORD biPlanes;
    WORD biBitCount;
    DWORD biCompression;
    DWORD biSizeImage;
    LONG biXPelsPerMeter;
    LONG biYPelsPerMeter;
    DWORD biClrUsed;
    DWORD biClrImportant;
};

struct BITMAPINFO {
    BITMAPINFOHEADER bmiHeader;
    RGBQUAD bmiColors[1];
};

inline constexpr DWORD BI_RGB = 0;
inline constexpr UINT DIB_RGB_COLORS = 0;
inline constexpr DWORD SRCCOPY = 0x00CC0020;
inline constexpr int BLACKONWHITE = 1;
inline constexpr int WHITEONBLACK = 2;
inline constexpr int COLORONCOLOR = 3;
inline constexpr int HALFTONE = 4;

extern "C" {
// The screen's device context. The screen keeps no pixels here: drawing on it succeeds and
// leaves nothing, reading from it gives black.
UT_PLATFORM_API HDC GetDC(HWND window);
UT_PLATFORM_API int ReleaseDC(HWND window, HDC dc);
// A memory device context, with a 1 by 1 stock bitmap selected.
UT_PLATFORM_API HDC CreateCompatibleDC(HDC dc);
UT_PLATFORM_API BOOL DeleteDC(HDC dc);
// A zero width or height gives the 1 by 1 stock bitmap, as the system does.
UT_PLATFORM_API HBITMAP CreateCompatibleBitmap(HDC dc, int width, int height);
// Only 32-bit uncompressed sections (BI_RGB) without a file mapping; the pixels start zeroed.
UT_PLATFORM_API HBITMAP CreateDIBSection(HDC dc, const BITMAPINFO* info, UINT usage, void** bits,
                                         HANDLE section, DWORD offset);
// Only bitmaps can be selected, and only into memory device contexts.
UT_PLATFORM_API HGDIOBJ SelectObject(HDC dc, HGDIOBJ object);
UT_PLATFORM_API BOOL DeleteObject(HGDIOBJ object);
UT_PLATFORM_API int SetStretchBltMode(HDC dc, int mode);
UT_PLATFORM_API int GetStretchBltMode(HDC dc);
// SRCCOPY only. Every mode samples the nearest source pixel (the centre of each destination
// pixel mapped back); pixels outside either surface are skipped.
UT_PLATFORM_API BOOL StretchBlt(HDC target, int x, int y, int width, int height, HDC source, int sourceX,
                                int sourceY, int sourceWidth, int sourceHeight, DWORD operation);
}
