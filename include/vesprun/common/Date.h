#pragma once

#include <compare>
#include <cstdint>

namespace vesprun {

/// An instant, in seconds since 1970-01-01 00:00 UTC (leap seconds not counted) and nanoseconds
/// after that second. `nanoseconds` is always 0 to 999,999,999, also before 1970.
struct Date {
  std::int64_t seconds = 0;
  std::uint32_t nanoseconds = 0;

  auto operator<=>(const Date&) const = default;
};

}  // namespace vesprun
