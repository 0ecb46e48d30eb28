#pragma once

#include <cstdint>
#include <limits>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// Minimum, maximum, mean and sum of squared deviations in one pass (Welford's algorithm, in double
/// precision); 0.0 before the first value.
///
/// The count is a signed 32-bit number and stops at 2^31 − 1: later values no longer raise
/// the count but still move the mean.
class DistributionStats {
 public:
  void add(double value) {
    if (_count == 0) {
      _minimum = _maximum = _mean = value;
      _count = 1;
      return;
    }
    if (value < _minimum) {
      _minimum = value;
    } else if (value > _maximum) {
      _maximum = value;
    }
    _count += _count < std::numeric_limits<std::int32_t>::max() ? 1 : 0;
    const double deviation = value - _mean;
    _mean += deviation / _count;
    _squaredDeviations += deviation * (value - _mean);
  }

  /// Minimum, maximum, mean, sum of squared deviations (not divided by the count) as doubles; the
  /// count as a signed 32-bit number.
  PropertyArray toArray() const { return {_minimum, _maximum, _mean, _squaredDeviations, _count}; }

 private:
  double _minimum = 0.0;
  double _maximum = 0.0;
  double _mean = 0.0;
  double _squaredDeviations = 0.0;
  std::int32_t _count = 0;
};

}  // namespace vesprun
