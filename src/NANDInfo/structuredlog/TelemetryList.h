#pragma once

#include <cstdint>
#include <span>
#include <string_view>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// Logs a record for each NAND bus, in signed 32-bit numbers: wear figures of the bus, then its
/// decoded counters. Of the `characteristics`, "chip-id" (at most 63 bytes) and "manufacturer-id"
/// (hexadecimal digits) select the layout of the counters; "num-bus" is the number of buses.
///
/// False, with a line on standard error and nothing logged, when a characteristic is missing or
/// unusable, the buffer does not hold all buses, or memory runs out.
bool LogNANDTelemetryList(std::span<const std::uint8_t> buffer,
                          const PropertyValue* characteristics, std::string_view className);

/// The value of up to two leading characters, at most `length`, as hexadecimal digits. Any other
/// character prints "unrecognized hex character: %c", in lower case, to standard output and counts
/// as 0.
std::uint8_t hexStringToByte(std::string_view text, std::uint32_t length);

/// The same for eight characters, in pairs from the left: "12345678" is 0x12345678. A last odd one
/// is a byte of its own: "123" is 0x1203.
std::uint32_t hexStringToInt32(std::string_view text, std::uint32_t length);

}  // namespace vesprun
