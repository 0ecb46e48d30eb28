#pragma once

#include <compare>
#include <cstdint>

namespace vesprun {

/// Seconds since 1970-01-01 00:00 UTC without leap seconds, and nanoseconds after that second, 0 to
/// 999,999,999 (before 1970 as well).
struct Date {
  std::int64_t seconds = 0;
  std::uint32_t nanoseconds = 0;

  auto operator<=>(const Date&) const = default;
};

}  // namespace vesprun
