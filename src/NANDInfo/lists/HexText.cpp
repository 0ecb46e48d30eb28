#include "NANDInfo/lists/HexText.h"

#include <algorithm>
#include <cstddef>
#include <cstdio>

namespace vesprun {
namespace {

std::string_view firstOf(std::string_view text, std::uint32_t length, std::size_t most) {
  return text.substr(0, std::min<std::size_t>(length, most));
}

}  // namespace

std::uint8_t hexStringToByte(std::string_view text, std::uint32_t length) {
  unsigned value = 0;
  for (char c : firstOf(text, length, 2)) {
    if (c >= 'A' && c <= 'Z') {
      c = static_cast<char>(c - 'A' + 'a');
    }
    value *= 16;
    if (c >= '0' && c <= '9') {
      value += static_cast<unsigned>(c - '0');
    } else if (c >= 'a' && c <= 'f') {
      value += static_cast<unsigned>(c - 'a') + 10;
    } else {
      std::printf("unrecognized hex character: %c", c);
    }
  }
  return static_cast<std::uint8_t>(value);
}

std::uint32_t hexStringToInt32(std::string_view text, std::uint32_t length) {
  std::uint32_t value = 0;
  for (std::string_view rest = firstOf(text, length, 8); !rest.empty();) {
    const std::size_t byte = (rest.size() - 1) / 2;
    value |= std::uint32_t{hexStringToByte(rest, 2)} << (8 * byte);
    rest.remove_prefix(std::min<std::size_t>(rest.size(), 2));
  }
  return value;
}

}  // namespace vesprun
