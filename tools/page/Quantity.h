#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "vesprun/Date.h"
#include "vesprun/Number.h"

namespace vesprun {

/// What a figure is counted in.
enum class Unit {
  None,
  Byte,
  KiB,
  MiB,
  GiB,
  Milliseconds,
  Seconds,
  Hours,
  Celsius,
  Percent,
  BasisPoints,
  Megahertz,
  Pages,
  Tenths,
};

/// By the name of a unit in a table, or by what a key ends in, such as "KiB" or "Milliseconds".
Unit unitNamed(std::string_view name);
Unit unitOfKey(std::string_view key);

/// A number for people, with its unit: "1.5 GiB", "12.3 s", "85 %". Three digits are shown at
/// least, and of whole numbers without a unit all.
std::string quantity(double value, Unit unit);

/// An integer with its digits in groups of three, a fraction with six digits.
std::string numeral(const Number& number);
std::string numeral(double value);
std::string numeral(std::size_t count);

/// "1 day", "2 days".
std::string countedNoun(std::size_t count, const char* noun);

/// "2024-03-05" and "2024-03-05 09:15".
std::string dayText(std::int32_t day);
std::string minuteText(const Date& date);

/// The time of a day number with a fraction, the day alone without one.
std::string momentText(double day);

/// "2024-03-05" or "2024-03-05 to 2024-03-09".
std::string daysText(std::int32_t from, std::int32_t to);

}  // namespace vesprun
