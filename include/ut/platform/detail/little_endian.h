// Numbers stored least significant byte first, as the file formats the library reads keep them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace ut::platform {

// The `size` bytes (1 to 4) at `at` as an unsigned number; the caller has checked they are there.
inline std::uint32_t ReadLittleEndian(const std::vector<std::uint8_t>& bytes, std::size_t at, int size = 4) {
    std::uint32_t value = 0;
    for (int i = size - 1; i >= 0; --i)
        value = value << 8 | bytes[at + static_cast<std::size_t>(i)];
    return value;
}

} // namespace ut::platform
