#pragma once

#include <cstdint>
#include <span>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// Logs a controller's telemetry list as one structured record of type 176 for each NAND bus, all
/// numbers signed 32-bit: wear figures of the bus, then its decoded counters.
///
/// `characteristics` is the controller's dictionary: "chip-id" (at most 63 bytes) and
/// "manufacturer-id" (hexadecimal digits; digits that are not there count as none) select the
/// layout of the counters, "num-bus" the number of buses. With 0 buses, or fewer, there is nothing
/// to log. `className` is not used.
///
/// False, with a line on the standard error stream and nothing logged, when a characteristic is
/// missing or unusable, when the buffer does not hold all buses, or when there is no memory for
/// the counters.
bool LogNANDTelemetryList(std::span<const std::uint8_t> buffer,
                          const PropertyValue* characteristics, std::string_view className);

/// The value of the first two characters of `text`, or of as many as there are or as `length` says,
/// read as hexadecimal digits. A character that is none prints "unrecognized hex character: %c", in
/// lower case, to standard output and counts as 0.
std::uint8_t hexStringToByte(std::string_view text, std::uint32_t length);

/// The same for the first eight characters, read in pairs from the left: "12345678" is 0x12345678.
/// With an odd number of characters the last one alone is the least significant byte: "123" is
/// 0x1203.
std::uint32_t hexStringToInt32(std::string_view text, std::uint32_t length);

}  // namespace vesprun
