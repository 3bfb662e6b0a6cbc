// The standard-error half of ReportError, the same on both homes.
#pragma once

#include <cstdio>
#include <string>

#include <ut/platform/text.h>

namespace ut::platform {

// Writes `line` and a line break to standard error, in UTF-8, and flushes it.
inline void WriteErrorLine(const std::wstring& line) {
    std::string text = Utf8FromWide(line);
    std::fprintf(stderr, "%s\n", text.c_str());
    std::fflush(stderr);
}

} // namespace ut::platform
