#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace vesprun {

/// What a figure was on a day.
struct DayValue {
  std::int32_t day;
  double value;
};

/// How unusual a figure is on a day, beside those of up to 28 days before.
struct Unusual {
  double score;  ///< how many times as far from the middle as days usually are
  std::int32_t day;
  double value;
  std::optional<double> before;  ///< the value before it
  double usual;                  ///< the median of the days before
  double lowest;                 ///< of the days before
  double highest;
};

/// From this score on a figure counts as unusual: with values that scatter as most do, once in some
/// thousand keys.
inline constexpr double kMinUnusualScore = 4.5;

/// Days that there must be before a day is judged.
inline constexpr std::size_t kMinDaysBefore = 7;

/// Judges the last of the values, ascending by day. Nothing without enough values before it.
///
/// The distance from the median is measured in median absolute deviations, of the values and of
/// their logarithms or roots, and, as days of the week differ, also from those of the same weekday;
/// the least counts. A figure that was always the same is unusual as soon as it moves; one that has
/// lately been so a few times is not.
std::optional<Unusual> unusualLast(std::span<const DayValue> values);

/// A figure that has slowly gone one way.
struct Drift {
  double score;
  std::int32_t since;
  double from;  ///< the median of the first seven days
  double to;    ///< the median of the last seven days
};

/// Judges the course of the values as a whole: by how many pairs of days are in order (Kendall), as
/// far as days are independent of those before them. Nothing without a drift.
std::optional<Drift> driftOf(std::span<const DayValue> values);

/// What a figure that only grows grew by on each day.
std::vector<DayValue> growthOf(std::span<const DayValue> values);

double medianOf(std::vector<double> values);

}  // namespace vesprun
