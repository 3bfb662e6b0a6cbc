// Conversions between the in-memory wide text (wchar_t on both homes) and the encodings that
// leave the process: UTF-8 for POSIX file names and messages, UTF-16LE for streams.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include <ut/platform/com.h>

namespace ut::platform {

// Invalid sequences become U+FFFD; nothing is dropped silently.
UT_PLATFORM_API std::wstring WideFromUtf8(std::string_view text);
UT_PLATFORM_API std::string Utf8FromWide(std::wstring_view text);

// Number of UTF-16 code units that `text` takes on a stream.
UT_PLATFORM_API std::size_t Utf16Length(std::wstring_view text);
// Appends the UTF-16LE bytes of `text` to `out`.
UT_PLATFORM_API void AppendUtf16Le(std::wstring_view text, std::string& out);
// Writes the UTF-16LE bytes of `text` to `out`, which has room for 2 * Utf16Length(text)
// bytes, and returns the code units written. For callers that encode in place.
UT_PLATFORM_API std::size_t WriteUtf16Le(std::wstring_view text, std::uint8_t* out);
// Decodes `units` UTF-16LE code units from `bytes`. Unpaired surrogates become U+FFFD where
// wchar_t is 32-bit; where it is 16-bit they are kept as they are.
UT_PLATFORM_API std::wstring WideFromUtf16Le(const std::uint8_t* bytes, std::size_t units);
// The same into `out`, which has room for `units` characters; returns the characters written
// (fewer than `units` where surrogate pairs join). For callers that decode in place.
UT_PLATFORM_API std::size_t DecodeUtf16Le(const std::uint8_t* bytes, std::size_t units, wchar_t* out);

} // namespace ut::platform
