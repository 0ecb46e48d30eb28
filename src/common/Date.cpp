#include "common/Date.h"

#include <algorithm>
#include <cstdio>
#include <limits>

namespace vesprun {
namespace {

struct CivilDay {
  std::int64_t year;
  unsigned month;
  unsigned day;
};

// Both conversions count in eras of 400 years (146097 days) that start on 1 March, so that the leap
// day is the last day of a year. std::chrono's calendar ends at the year 32767, day numbers do not.
constexpr std::int64_t kDaysPerEra = 146097;
constexpr std::int64_t kDaysFromEraStartTo1970 = 719468;
constexpr std::int64_t kLargestYear = 10'000'000;  // beyond every 32-bit day number

std::int64_t floorDivide(std::int64_t value, std::int64_t divisor) {
  return value / divisor - (value % divisor < 0 ? 1 : 0);
}

CivilDay civilDay(std::int64_t days) {
  days += kDaysFromEraStartTo1970;
  const std::int64_t era = floorDivide(days, kDaysPerEra);
  const auto dayOfEra = static_cast<unsigned>(days - era * kDaysPerEra);
  const unsigned yearOfEra =
      (dayOfEra - dayOfEra / 1460 + dayOfEra / 36524 - dayOfEra / 146096) / 365;
  const unsigned dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
  const unsigned marchMonth = (5 * dayOfYear + 2) / 153;
  const unsigned day = dayOfYear - (153 * marchMonth + 2) / 5 + 1;
  const unsigned month = marchMonth < 10 ? marchMonth + 3 : marchMonth - 9;
  return {static_cast<std::int64_t>(yearOfEra) + era * 400 + (month <= 2 ? 1 : 0), month, day};
}

std::int64_t dayNumber(const CivilDay& civil) {
  const std::int64_t year = civil.year - (civil.month <= 2 ? 1 : 0);
  const std::int64_t era = floorDivide(year, 400);
  const auto yearOfEra = static_cast<unsigned>(year - era * 400);
  const unsigned marchMonth = civil.month > 2 ? civil.month - 3 : civil.month + 9;
  const unsigned dayOfYear = (153 * marchMonth + 2) / 5 + civil.day - 1;
  const unsigned dayOfEra = yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear;
  return era * kDaysPerEra + static_cast<std::int64_t>(dayOfEra) - kDaysFromEraStartTo1970;
}

/// Takes characters off the front of a text, remembering whether everything fitted so far.
class Scanner {
 public:
  explicit Scanner(std::string_view text) : _rest(text) {}

  unsigned digits(std::size_t count) {
    unsigned value = 0;
    if (_rest.size() < count) {
      return fail();
    }
    for (const char c : _rest.substr(0, count)) {
      if (c < '0' || c > '9') {
        return fail();
      }
      value = value * 10 + static_cast<unsigned>(c - '0');
    }
    _rest.remove_prefix(count);
    return value;
  }

  bool take(char c) {
    if (_rest.empty() || _rest.front() != c) {
      return false;
    }
    _rest.remove_prefix(1);
    return true;
  }

  void expect(char c) {
    if (!take(c)) {
      fail();
    }
  }

  std::size_t leadingDigits() const {
    return std::min(_rest.find_first_not_of("0123456789"), _rest.size());
  }

  unsigned fail() {
    _good = false;
    return 0;
  }

  bool finished() const { return _good && _rest.empty(); }

 private:
  std::string_view _rest;
  bool _good = true;
};

}  // namespace

double secondsBetween(const Date& earlier, const Date& later) {
  // Subtracting as doubles never overflows; whole seconds of today's dates are exact.
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
  const CivilDay civil = civilDay(days);
  char text[64];
  int length = std::snprintf(
      text, sizeof text, "%s%04lld-%02u-%02uT%02u:%02u:%02u", civil.year < 0 ? "-" : "",
      static_cast<long long>(civil.year < 0 ? -civil.year : civil.year), civil.month, civil.day,
      secondOfDay / 3600, secondOfDay / 60 % 60, secondOfDay % 60);
  std::string result(text, static_cast<std::size_t>(length));
  if (date.nanoseconds != 0) {
    length = std::snprintf(text, sizeof text, ".%09u", date.nanoseconds);
    result.append(text, static_cast<std::size_t>(length));
    result.erase(result.find_last_not_of('0') + 1);
  }
  return result + 'Z';
}

std::optional<Date> parseDateText(std::string_view text) {
  Scanner scanner(text);
  const bool beforeYearZero = scanner.take('-');
  const std::size_t yearDigits = scanner.leadingDigits();
  if (yearDigits < 4 || yearDigits > 8) {
    return std::nullopt;
  }
  CivilDay civil{};
  civil.year = scanner.digits(yearDigits);
  if (beforeYearZero) {
    civil.year = -civil.year;
  }
  scanner.expect('-');
  civil.month = scanner.digits(2);
  scanner.expect('-');
  civil.day = scanner.digits(2);
  scanner.expect('T');
  const unsigned hour = scanner.digits(2);
  scanner.expect(':');
  const unsigned minute = scanner.digits(2);
  scanner.expect(':');
  const unsigned second = scanner.digits(2);
  std::uint32_t nanoseconds = 0;
  if (scanner.take('.')) {
    const std::size_t count = scanner.leadingDigits();
    if (count < 1 || count > 9) {
      return std::nullopt;
    }
    nanoseconds = scanner.digits(count);
    for (std::size_t i = count; i < 9; ++i) {
      nanoseconds *= 10;
    }
  }
  scanner.expect('Z');
  if (!scanner.finished() || civil.year > kLargestYear || civil.year < -kLargestYear ||
      civil.month < 1 || civil.month > 12 || hour > 23 || minute > 59 || second > 59) {
    return std::nullopt;
  }
  const std::int64_t days = dayNumber(civil);
  const CivilDay exact = civilDay(days);
  if (exact.month != civil.month || exact.day != civil.day) {
    return std::nullopt;  // 30 February and the like
  }
  return Date{days * kSecondsPerDay + hour * 3600 + minute * 60 + second, nanoseconds};
}

}  // namespace vesprun
