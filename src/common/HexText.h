#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace vesprun {

inline constexpr std::string_view kLowerHexDigits = "0123456789abcdef";
inline constexpr std::string_view kUpperHexDigits = "0123456789ABCDEF";

/// Appends the two hexadecimal digits of a byte.
inline void appendHex(std::string& text, std::uint8_t byte,
                      std::string_view digits = kLowerHexDigits) {
  text += digits[byte >> 4];
  text += digits[byte & 15];
}

}  // namespace vesprun
