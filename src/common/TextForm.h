#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// The text of a value in log lines and labels ("%@"):
/// - a string as it is, an integer in decimal, a boolean "1" or "0";
/// - a fraction as the shortest text that reads back to it, without a fraction part if it has none
///   ("10", "0.25", "1e+30"), or "inf", "-inf", "nan";
/// - a date "2024-03-05 09:15:02 +0000", data "<0a1bff>";
/// - an array "(a, b)", a dictionary "{key = value; key = value}", in order.
std::string textForm(const PropertyValue& value);

std::string textForm(const Number& number);

/// "(null)" for a missing value.
std::string textFormOrNull(const std::optional<PropertyValue>& value);

/// Two lowercase digits for each byte.
std::string hexadecimalText(std::span<const std::uint8_t> bytes);

}  // namespace vesprun
