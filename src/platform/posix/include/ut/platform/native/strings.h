// POSIX home: the byte case table that the C library's tolower reads, reached inline so that a
// comparison pays no call for it.
#pragma once

#include <cctype>
#include <cstdint>

namespace ut::platform::native {

// Indexable from -128 to 255; null where the C library lends no table.
inline const std::int32_t* ByteFoldTable() {
#ifdef __GLIBC__
    return *__ctype_tolower_loc();
#else
    return nullptr;
#endif
}

} // namespace ut::platform::native
