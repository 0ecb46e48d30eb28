#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "vesprun/Date.h"

namespace vesprun {

inline constexpr std::int64_t kSecondsPerDay = 86400;

/// `later` − `earlier` in seconds.
double secondsBetween(const Date& earlier, const Date& later);

/// The first instant (UTC) of any 32-bit day number.
Date startOfDay(std::int32_t daysSince1970);

/// The day number (UTC), saturated to 32 bits.
std::int32_t daysSince1970(const Date& date);

/// "2024-03-05T09:15:02Z", with up to nine digits of a fraction. Years have at least four digits
/// and a sign only when negative.
std::string dateText(const Date& date);

/// Reads the form of `dateText`; nothing for any other text or a date that does not exist.
std::optional<Date> parseDateText(std::string_view text);

}  // namespace vesprun
