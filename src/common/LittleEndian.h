#pragma once

#include <bit>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

namespace vesprun {

/// The little-endian unsigned integer of `width` bytes, 0 to 8, at any address.
inline std::uint64_t loadLittleEndian(const std::uint8_t* bytes, std::size_t width) {
  static_assert(std::endian::native == std::endian::little);
  std::uint64_t value = 0;
  std::memcpy(&value, bytes, width);
  return value;
}

/// The same for a type of that width.
template <std::unsigned_integral T>
T loadLittleEndian(const std::uint8_t* bytes) {
  return static_cast<T>(loadLittleEndian(bytes, sizeof(T)));
}

/// Appends the `width` low bytes of `value`, 0 to 8, least significant first.
inline void appendLittleEndian(std::vector<std::uint8_t>& bytes, std::uint64_t value,
                               std::size_t width) {
  for (std::size_t at = 0; at < width; ++at) {
    bytes.push_back(static_cast<std::uint8_t>(value >> (8 * at)));
  }
}

}  // namespace vesprun
