#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// Foreign text, escaped for use between tags or in a quoted attribute. A byte that is not UTF-8
/// becomes "\xnn", and a character that is invisible or changes the direction of others "\u{N}".
std::string htmlText(std::string_view text);

/// The same for a key or another name: in an element of its own, so that its direction changes
/// nothing around it, and cut in the middle when it is long (`isLongName`).
std::string htmlName(std::string_view name);
bool isLongName(std::string_view name);

/// An integer with its digits in groups of three, a fraction with six digits.
std::string numeral(const Number& number);
std::string numeral(double value);
std::string numeral(std::size_t count);

/// "1 day", "2 days".
std::string countedNoun(std::size_t count, const char* noun);

/// "2024-03-05" and "2024-03-05 09:15".
std::string dayText(std::int32_t day);
std::string minuteText(const Date& date);

}  // namespace vesprun
