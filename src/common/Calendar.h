#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "common/Date.h"

namespace vesprun {

inline constexpr std::int64_t kSecondsPerDay = 86400;

/// `later` − `earlier` in seconds, as a double.
double secondsBetween(const Date& earlier, const Date& later);

/// The first instant (UTC) of a day number. Defined for every 32-bit number.
Date startOfDay(std::int32_t daysSince1970);

/// The day number (UTC) that `date` lies in, cut to the range of a signed 32-bit number.
std::int32_t daysSince1970(const Date& date);

/// "2024-03-05T09:15:02Z", with a fraction of up to nine digits when there is one. Years have at
/// least four digits and a sign only when negative.
std::string dateText(const Date& date);

/// Reads what `dateText` writes; nothing for any other text or for a date that does not exist.
std::optional<Date> parseDateText(std::string_view text);

}  // namespace vesprun
