#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The boundaries of a histogram, prepared for many look-ups: n doubles bound n + 1 buckets.
class HistogramBoundaries {
 public:
  explicit HistogramBoundaries(const PropertyArray& intervals);

  std::size_t bucketCount() const { return _highest.size() + 1; }

 private:
  friend std::uint32_t determineHistBucketForValueWithIntervals(double, const HistogramBoundaries&);

  std::vector<double> _highest;  ///< running maximum of the boundaries; NaN before the first number
};

/// The index of the first boundary, in array order, that is not below `value`; n without such a
/// one, as for NaN.
inline std::uint32_t determineHistBucketForValueWithIntervals(
    double value, const HistogramBoundaries& intervals) {
  // The running maximum is sorted, and first reaches a value where a boundary first does.
  // Branchless: values come in any order.
  std::size_t bucket = 0;
  for (std::size_t rest = intervals._highest.size(); rest > 0;) {
    const std::size_t half = (rest + 1) / 2;
    bucket += intervals._highest[bucket + half - 1] >= value ? 0 : half;
    rest -= half;
  }
  return static_cast<std::uint32_t>(bucket);
}

/// Label to count (unsigned 64-bit) of non-empty buckets, in order; nothing if all are empty.
/// Bucket i is "(lower, upper]", the last one "(lower, inf)", the first lower boundary "-inf", with
/// boundaries in text form. `counts` has one element more than `intervals`.
std::optional<PropertyDict> histogramDictForIntervalsWithHistCounts(
    const PropertyArray& intervals, std::span<const std::uint64_t> counts);

}  // namespace vesprun
