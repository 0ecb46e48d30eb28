#pragma once

#include <cmath>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vesprun {

/// The figures of one distribution in a daily log.
struct Statistics {
  double minimum = 0;
  double maximum = 0;
  double mean = 0;
  double deviations = 0;  ///< sum of squared deviations from the mean
  std::int64_t count = 0;
};

/// Label of a bucket to the number of values in it.
using Histogram = std::map<std::string, std::uint64_t>;

struct Distribution {
  Statistics statistics;
  std::optional<Histogram> histogram;
};

/// The statistics of all values behind `parts`, which must not be empty. The order of the parts
/// changes no bit of the result.
Statistics mergedStatistics(std::vector<Statistics> parts);

/// A sum that keeps what each addition loses (Neumaier), and more bits than a double.
class Sum {
 public:
  void add(long double value) {
    const long double sum = _sum + value;
    _lost += std::abs(_sum) >= std::abs(value) ? (_sum - sum) + value : (value - sum) + _sum;
    _sum = sum;
  }
  long double value() const { return _sum + _lost; }

 private:
  long double _sum = 0;
  long double _lost = 0;
};

__extension__ using Int128 = __int128;

/// The quotient as a double; the sum cannot overflow.
double meanOf(Int128 sum, std::int64_t count);

/// One device's integer.
struct DeviceValue {
  std::int64_t device = 0;
  std::int64_t value = 0;
};

/// The mean and quantiles of integers of many devices.
struct Summary {
  double mean = 0;
  /// One for each of `kPercents`; nothing where too few devices have a value at or below it, or at
  /// or above it.
  std::vector<std::optional<std::int64_t>> quantiles;
};

inline constexpr int kPercents[] = {5, 25, 50, 75, 95};

/// Summarizes the values of at least `least` devices. The quantile q of n values is the ⌈q·n⌉-th
/// smallest.
Summary summaryOf(std::vector<DeviceValue> values, std::uint64_t least);

/// The values of a group of devices, one of each.
struct Spread {
  std::uint64_t count = 0;
  long double mean = 0;
  long double variance = 0;  ///< of count - 1; 0 where all values are equal
};

/// Are two values equal? Those that were merged may differ by what rounding takes.
bool areEqual(double left, double right, bool areMerged);

Spread spreadOf(std::vector<double> values, bool areMerged);

/// The labels of a histogram by their boundaries, from low to high; labels of another form last.
/// `overlap` becomes true when two buckets overlap: devices counted between different boundaries.
std::vector<std::string> labelsInOrder(const Histogram& histogram, bool& overlap);

}  // namespace vesprun
