#include "page/Quantity.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <iterator>
#include <span>

#include "common/Calendar.h"
#include "common/TextForm.h"

namespace vesprun {
namespace {

constexpr const char* kNarrowSpace = "\u202F";

/// Digits, with what may stand before and after them, in groups of three.
std::string grouped(std::string text) {
  const std::size_t start = text.find_first_of("0123456789");
  std::size_t end = text.find_first_not_of("0123456789", start);
  end = end == std::string::npos ? text.size() : end;
  constexpr std::size_t kGroup = 3;
  for (std::size_t place = end; start != std::string::npos && place > start + kGroup;) {
    place -= kGroup;
    text.insert(place, kNarrowSpace);
  }
  return text;
}

/// Without digits that say nothing: three, or all of a whole number below a million.
std::string shortNumeral(double value) {
  const double size = std::abs(value);
  char digits[64];
  if (!(size < 1e15)) {
    std::snprintf(digits, sizeof digits, "%.3g", value);
  } else if (size >= 100 || value == std::trunc(value)) {
    std::snprintf(digits, sizeof digits, "%.0f", value);
  } else {
    std::snprintf(digits, sizeof digits, "%.3g", value);
  }
  return grouped(digits);
}

struct Step {
  double factor;  ///< of the smallest
  const char* name;
};
constexpr Step kSizes[] = {{1, "B"},        {0x1p10, "KiB"}, {0x1p20, "MiB"},
                           {0x1p30, "GiB"}, {0x1p40, "TiB"}, {0x1p50, "PiB"}};
constexpr Step kTimes[] = {{1, "ms"}, {1e3, "s"}, {6e4, "min"}, {36e5, "h"}, {864e5, "d"}};

/// In the largest step that leaves a number of at least two.
std::string inSteps(double value, std::span<const Step> steps) {
  const Step* best = &steps.front();
  for (const Step& step : steps) {
    if (std::abs(value) >= 2 * step.factor) {
      best = &step;
    }
  }
  return shortNumeral(value / best->factor) + kNarrowSpace + best->name;
}

constexpr struct {
  std::string_view name;
  Unit unit;
} kNames[] = {{"Bytes", Unit::Byte},
              {"KiB", Unit::KiB},
              {"MiB", Unit::MiB},
              {"GiB", Unit::GiB},
              {"_GB", Unit::GiB},
              {"ms", Unit::Milliseconds},
              {"Milliseconds", Unit::Milliseconds},
              {"s", Unit::Seconds},
              {"Seconds", Unit::Seconds},
              {"Hours", Unit::Hours},
              {"degrees Celsius", Unit::Celsius},
              {"Celsius", Unit::Celsius},
              {"Percent", Unit::Percent},
              {"percent", Unit::Percent},
              {"percentUsed", Unit::Percent},
              {"PercentUsed", Unit::Percent},
              {"_BP", Unit::BasisPoints},
              {"MHz", Unit::Megahertz},
              {"pages", Unit::Pages},
              {"Pages", Unit::Pages},
              {"tenths", Unit::Tenths}};

}  // namespace

Unit unitNamed(std::string_view name) {
  const auto found =
      std::ranges::find_if(kNames, [=](const auto& row) { return row.name == name; });
  return found != std::end(kNames) ? found->unit : Unit::None;
}

Unit unitOfKey(std::string_view key) {
  constexpr std::size_t kLeast = 3;  // shorter ones end too many words
  Unit unit = Unit::None;
  std::size_t longest = kLeast - 1;
  for (const auto& row : kNames) {
    if (row.name.size() > longest && key.ends_with(row.name)) {
      unit = row.unit;
      longest = row.name.size();
    }
  }
  return unit;
}

std::string quantity(double value, Unit unit) {
  if (!std::isfinite(value)) {
    return std::isnan(value) ? "not a number" : value > 0 ? "infinite" : "−infinite";
  }
  const auto with = [](double number, const char* name) {
    return shortNumeral(number) + kNarrowSpace + name;
  };
  switch (unit) {
    case Unit::Byte:
      return inSteps(value, kSizes);
    case Unit::KiB:
      return value == 0 ? with(0, "KiB") : inSteps(value * 0x1p10, kSizes);
    case Unit::MiB:
      return value == 0 ? with(0, "MiB") : inSteps(value * 0x1p20, kSizes);
    case Unit::GiB:
      return with(value, "GB");
    case Unit::Milliseconds:
      return inSteps(value, kTimes);
    case Unit::Seconds:
      return value == 0 ? with(0, "s") : inSteps(value * 1e3, kTimes);
    case Unit::Hours:
      return with(value, "h");
    case Unit::Celsius:
      return with(value, "°C");
    case Unit::Percent:
      return with(value, "%");
    case Unit::BasisPoints:
      return with(value / 100, "%");
    case Unit::Megahertz:
      return with(value, "MHz");
    case Unit::Pages:
      return with(value, "pages");
    case Unit::Tenths:
      return with(value, "tenths");
    case Unit::None:
      break;
  }
  return shortNumeral(value);
}

std::string numeral(const Number& number) {
  return number.isFloatingPoint() ? numeral(number.asDouble()) : grouped(textForm(number));
}

std::string numeral(double value) {
  constexpr double kMinWithoutFraction = 1e5;
  constexpr double kMinWithExponent = 1e15;
  const double size = std::abs(value);
  char digits[64];
  const bool isWhole = size >= kMinWithoutFraction && size < kMinWithExponent;
  std::snprintf(digits, sizeof digits, isWhole ? "%.0f" : "%.6g", value);
  return grouped(digits);
}

std::string numeral(std::size_t count) { return grouped(std::to_string(count)); }

std::string countedNoun(std::size_t count, const char* noun) {
  return numeral(count) + ' ' + noun + (count == 1 ? "" : "s");
}

std::string dayText(std::int32_t day) {
  const std::string text = dateText(startOfDay(day));
  return text.substr(0, text.find('T'));
}

std::string minuteText(const Date& date) {
  std::string text = dateText(date);
  const std::size_t time = text.find('T');
  text.replace(time, 1, " ");
  return text.substr(0, time + 6);
}

std::string momentText(double day) {
  const double start = std::floor(day);
  const auto number = static_cast<std::int32_t>(std::clamp(start, -2147483648.0, 2147483647.0));
  Date date = startOfDay(number);
  if (day == start) {
    return dayText(number);
  }
  date.seconds += std::llround((day - start) * static_cast<double>(kSecondsPerDay));
  return minuteText(date);
}

std::string daysText(std::int32_t from, std::int32_t to) {
  return from == to ? dayText(from) : dayText(from) + " to " + dayText(to);
}

}  // namespace vesprun
