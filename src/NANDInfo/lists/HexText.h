#pragma once

#include <cstdint>
#include <string_view>

namespace vesprun {

/// The value of the first two characters of `text`, or of as many as there are or as `length` says,
/// read as hexadecimal digits. A character that is none prints "unrecognized hex character: %c", in
/// lower case, to standard output and counts as 0.
std::uint8_t hexStringToByte(std::string_view text, std::uint32_t length);

/// The same for the first eight characters, read in pairs from the left: "12345678" is 0x12345678.
/// With an odd number of characters the last one alone is the least significant byte: "123" is
/// 0x1203.
std::uint32_t hexStringToInt32(std::string_view text, std::uint32_t length);

}  // namespace vesprun
