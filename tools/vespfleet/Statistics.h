#pragma once

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

/// The smallest, the greatest, the mean and quantiles of integers.
struct Summary {
  std::int64_t minimum = 0;
  std::int64_t maximum = 0;
  double mean = 0;
  std::vector<std::int64_t> quantiles;  ///< one for each of `kPercents`
};

inline constexpr int kPercents[] = {5, 25, 50, 75, 95};

/// Summarizes one or more values. The quantile q of n values is the ⌈q·n⌉-th smallest.
Summary summaryOf(std::vector<std::int64_t> values);

/// The labels of a histogram by their boundaries, from low to high; labels of another form last.
/// `overlap` becomes true when two buckets overlap: devices counted between different boundaries.
std::vector<std::string> labelsInOrder(const Histogram& histogram, bool& overlap);

}  // namespace vesprun
