#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "common/PropertyValue.h"

namespace vesprun {

/// The text that stands for a value in log lines and labels ("%@"):
/// - a string is itself;
/// - an integer is decimal, a boolean "1" or "0";
/// - a double or float is the shortest text that reads back to the same number, without a fraction
///   when it has none ("10", "0.25", "1e+30"), and "inf", "-inf" or "nan";
/// - a date is "2024-03-05 09:15:02 +0000";
/// - data is "<0a1bff>";
/// - an array is "(a, b)" and a dictionary "{key = value; key = value}", in order.
std::string textForm(const PropertyValue& value);

std::string textForm(const Number& number);

/// The text form of a value that may be missing, which is "(null)" then.
std::string textFormOrNull(const std::optional<PropertyValue>& value);

/// Two lowercase digits for each byte.
std::string hexadecimalText(std::span<const std::uint8_t> bytes);

}  // namespace vesprun
