#include "common/Calendar.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <limits>

namespace vesprun {
namespace {

// std::chrono's calendar ends with the year 32767. So it is used within one era of 400 years: all
// eras have the same number of days.
constexpr std::int64_t kDaysPerEra = 146097;
constexpr std::int64_t kYearsPerEra = 400;
constexpr std::int64_t kMaxYear = 10'000'000;  // beyond every 32-bit day number

constexpr std::string_view kDateForm = "-##-##T##:##:##";  // after the year; # is a digit

std::int64_t floorDivide(std::int64_t value, std::int64_t divisor) {
  return value / divisor - (value % divisor < 0 ? 1 : 0);
}

bool isDigit(char c) { return c >= '0' && c <= '9'; }

std::size_t leadingDigits(std::string_view text) {
  return static_cast<std::size_t>(std::find_if_not(text.begin(), text.end(), isDigit) -
                                  text.begin());
}

unsigned numberOf(std::string_view digits) {
  unsigned number = 0;
  for (const char digit : digits) {
    number = number * 10 + static_cast<unsigned>(digit - '0');
  }
  return number;
}

bool hasDateForm(std::string_view text) {
  return text.size() >= kDateForm.size() &&
         std::equal(kDateForm.begin(), kDateForm.end(), text.begin(),
                    [](char form, char c) { return form == '#' ? isDigit(c) : form == c; });
}

}  // namespace

double secondsBetween(const Date& earlier, const Date& later) {
  // Doubles cannot overflow, and hold today's whole seconds exactly.
  const double seconds = static_cast<double>(later.seconds) - static_cast<double>(earlier.seconds);
  return seconds +
         (static_cast<double>(later.nanoseconds) - static_cast<double>(earlier.nanoseconds)) * 1e-9;
}

Date startOfDay(std::int32_t daysSince1970) {
  return {std::int64_t{daysSince1970} * kSecondsPerDay, 0};
}

std::int32_t daysSince1970(const Date& date) {
  const std::int64_t days = floorDivide(date.seconds, kSecondsPerDay);
  return static_cast<std::int32_t>(std::clamp<std::int64_t>(
      days, std::numeric_limits<std::int32_t>::min(), std::numeric_limits<std::int32_t>::max()));
}

std::string dateText(const Date& date) {
  const std::int64_t days = floorDivide(date.seconds, kSecondsPerDay);
  const auto secondOfDay = static_cast<unsigned>(date.seconds - days * kSecondsPerDay);
  const std::int64_t era = floorDivide(days, kDaysPerEra);
  const std::chrono::year_month_day inEra(
      std::chrono::sys_days(std::chrono::days(days - era * kDaysPerEra)));
  const std::int64_t year = int{inEra.year()} + era * kYearsPerEra;
  char text[64];
  int length = std::snprintf(text, sizeof text, "%s%04lld-%02u-%02uT%02u:%02u:%02u",
                             year < 0 ? "-" : "", static_cast<long long>(year < 0 ? -year : year),
                             unsigned{inEra.month()}, unsigned{inEra.day()}, secondOfDay / 3600,
                             secondOfDay / 60 % 60, secondOfDay % 60);
  std::string result(text, static_cast<std::size_t>(length));
  if (date.nanoseconds != 0) {
    length = std::snprintf(text, sizeof text, ".%09u", date.nanoseconds);
    result.append(text, static_cast<std::size_t>(length));
    result.erase(result.find_last_not_of('0') + 1);
  }
  return result + 'Z';
}

std::optional<Date> parseDateText(std::string_view text) {
  const bool isBeforeYearZero = text.starts_with('-');
  text.remove_prefix(isBeforeYearZero ? 1 : 0);
  const std::size_t yearDigits = leadingDigits(text);
  if (yearDigits < 4 || yearDigits > 8 || !hasDateForm(text.substr(yearDigits))) {
    return std::nullopt;
  }
  const std::int64_t years = numberOf(text.substr(0, yearDigits));
  text.remove_prefix(yearDigits);
  const auto twoDigits = [text](std::size_t at) { return numberOf(text.substr(at, 2)); };
  const unsigned hour = twoDigits(7);
  const unsigned minute = twoDigits(10);
  const unsigned second = twoDigits(13);
  std::string_view rest = text.substr(kDateForm.size());
  unsigned nanoseconds = 0;
  if (rest.starts_with('.')) {
    const std::size_t count = leadingDigits(rest.substr(1));
    if (count < 1 || count > 9) {
      return std::nullopt;
    }
    nanoseconds = numberOf(rest.substr(1, count));
    for (std::size_t i = count; i < 9; ++i) {
      nanoseconds *= 10;
    }
    rest.remove_prefix(1 + count);
  }
  const std::int64_t year = isBeforeYearZero ? -years : years;
  const std::int64_t era = floorDivide(year, kYearsPerEra);
  const std::chrono::year_month_day inEra(
      std::chrono::year(static_cast<int>(year - era * kYearsPerEra)),
      std::chrono::month(twoDigits(1)), std::chrono::day(twoDigits(4)));
  if (rest != "Z" || years > kMaxYear || !inEra.ok() || hour > 23 || minute > 59 || second > 59) {
    return std::nullopt;
  }
  const std::int64_t days =
      std::chrono::sys_days(inEra).time_since_epoch().count() + era * kDaysPerEra;
  return Date{days * kSecondsPerDay + hour * 3600 + minute * 60 + second, nanoseconds};
}

}  // namespace vesprun
