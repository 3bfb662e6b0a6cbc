// Image to device bitmap: an image of the host's image library converted to the device's 32-bit
// blue-green-red-alpha layout, and fitted, aspect kept, into a device bitmap.
#pragma once

#include <ut/export.h>
#include <ut/platform/bitmap.h>
#include <ut/sdk/image.h>

// Converts columns x0 to x1 and rows y0 to y1 (both ends exclusive; note the order: both column
// bounds, then both row bounds) of a `width` by `height` image of `format` into packed 4-byte
// device pixels. A format other than the four of ut/sdk/image.h leaves `destination` untouched.
UT_API void KXRearrangeByteToGdiFormat(unsigned long* source, unsigned long* destination, unsigned long width,
                                       unsigned long height, unsigned long x0, unsigned long x1,
                                       unsigned long y0, unsigned long y1, GUID format);
// A device bitmap of the size of `rect` with the image stretched into it, centred, aspect kept.
// The fit is measured from the rectangle's right or bottom edge, so it is exact for a rectangle
// at the origin. E_POINTER for a null image or bitmap; *bitmap may hold the bitmap on failure.
UT_API HRESULT KXGetGWImageAsHBitmap(IGWImage* image, RECT* rect, HBITMAP* bitmap);
