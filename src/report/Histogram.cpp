#include "report/Histogram.h"

#include <cmath>
#include <limits>
#include <string>

#include "common/TextForm.h"

namespace vesprun {

HistogramBoundaries::HistogramBoundaries(const PropertyArray& intervals) {
  constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
  _highest.reserve(intervals.size());
  double highest = kNaN;
  for (const PropertyValue& interval : intervals) {
    const double boundary = interval.number() != nullptr ? interval.number()->asDouble() : kNaN;
    if (std::isnan(highest) || boundary > highest) {
      highest = boundary;
    }
    _highest.push_back(highest);
  }
}

std::optional<PropertyDict> histogramDictForIntervalsWithHistCounts(
    const PropertyArray& intervals, std::span<const std::uint64_t> counts) {
  constexpr double kInfinity = std::numeric_limits<double>::infinity();
  PropertyDict histogram;
  for (std::size_t i = 0; i < counts.size(); ++i) {
    if (counts[i] == 0) {
      continue;
    }
    const bool isLast = i == intervals.size();
    const std::string lower = textForm(i == 0 ? PropertyValue(-kInfinity) : intervals[i - 1]);
    const std::string upper = textForm(isLast ? PropertyValue(kInfinity) : intervals[i]);
    std::string label = "(";
    label.append(lower).append(", ").append(upper).append(isLast ? ")" : "]");
    histogram.set(label, counts[i]);
  }
  return histogram.empty() ? std::nullopt : std::optional(std::move(histogram));
}

}  // namespace vesprun
