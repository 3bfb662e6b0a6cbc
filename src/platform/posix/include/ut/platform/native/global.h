// POSIX home: global memory blocks with the Windows semantics. A fixed block's handle is its
// address; a movable block keeps its handle while GlobalReAlloc moves its bytes.
#pragma once

#include <ut/platform/native/com.h>

using HGLOBAL = HANDLE;

inline constexpr UINT GMEM_FIXED = 0x0000;
inline constexpr UINT GMEM_MOVEABLE = 0x0002;
inline constexpr UINT GMEM_ZEROINIT = 0x0040;
inline constexpr UINT GHND = GMEM_MOVEABLE | GMEM_ZEROINIT;
inline constexpr UINT GPTR = GMEM_FIXED | GMEM_ZEROINIT;
inline constexpr DWORD ERROR_NOT_LOCKED = 158;

extern "C" {
UT_PLATFORM_API HGLOBAL GlobalAlloc(UINT flags, SIZE_T bytes);
UT_PLATFORM_API HGLOBAL GlobalReAlloc(HGLOBAL block, SIZE_T bytes, UINT flags);
UT_PLATFORM_API void* GlobalLock(HGLOBAL block);
// Nonzero while the block stays locked; zero once unlocked (with the last error 0) or on error.
UT_PLATFORM_API BOOL GlobalUnlock(HGLOBAL block);
// Null on success; the handle itself when it names no block.
UT_PLATFORM_API HGLOBAL GlobalFree(HGLOBAL block);
UT_PLATFORM_API SIZE_T GlobalSize(HGLOBAL block);
}
