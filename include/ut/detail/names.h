// Names and sizes the library, its tool and its tests share.
#pragma once

namespace ut {

// The string dictionary the library registers on load and its user texts come from.
inline constexpr const wchar_t* kDictionaryName = L"QVXUT";

// The message catalog the library's error handling reports from.
inline constexpr const wchar_t* kCatalogName = L"kxmsgcat";

// The working buffers of path and file-name helpers, in wide characters (the platform path limit).
inline constexpr int kPathCapacity = 260;

} // namespace ut
