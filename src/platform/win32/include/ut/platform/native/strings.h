// Windows home: the CRT lends no case table, so bytes are folded one by one.
#pragma once

#include <cstdint>

namespace ut::platform::native {

inline const std::int32_t* ByteFoldTable() {
    return nullptr;
}

} // namespace ut::platform::native
