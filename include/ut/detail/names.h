// Names and sizes the library, its tool and its tests share.
#pragma once

namespace ut {

// The string dictionary the library registers on load and its user texts come from.
inline constexpr const wchar_t* kDictionaryName = L"QVXUT";

// The working buffers of path and file-name helpers, in wide characters (the platform path limit).
inline constexpr int kPathCapacity = 260;

} // namespace ut
