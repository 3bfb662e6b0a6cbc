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

// Writes the low `size` bytes (1 to 8) of `value` at `at`, least significant first.
inline void WriteLittleEndian(std::uint8_t* at, std::uint64_t value, int size = 4) {
    for (int i = 0; i < size; ++i, value >>= 8)
        at[i] = static_cast<std::uint8_t>(value);
}

// Appends the low `size` bytes (1 to 8) of `value` to `out`, least significant first.
inline void AppendLittleEndian(std::vector<std::uint8_t>& out, std::uint64_t value, int size = 4) {
    for (int i = 0; i < size; ++i, value >>= 8)
        out.push_back(static_cast<std::uint8_t>(value));
}

} // namespace ut::platform
