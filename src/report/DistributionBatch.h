#pragma once

#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "config/KeyOptions.h"
#include "platform/Tallybook.h"
#include "report/DistributionStats.h"
#include "report/Histogram.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// Interleaves the statistics of up to eight distributions to hide division latency. Each takes its
/// values in order.
class DistributionBatch {
 public:
  /// The outputs must outlive the object.
  DistributionBatch(PropertyDict& distributions, PropertyDict& histograms)
      : _distributions(distributions), _histograms(histograms) {}

  /// Takes all values. The results are stored, in the order of the calls, by this or a later call
  /// or by `finish`; until then the intervals must stay.
  void add(TBHistoryDistributionEnumerator& values, std::string_view key,
           const DistributionOptions& options);

  void finish();

 private:
  struct HistogramCounters {
    explicit HistogramCounters(const PropertyArray& intervals)
        : boundaries(intervals), counts(boundaries.bucketCount()) {}

    HistogramBoundaries boundaries;
    std::vector<std::uint64_t> counts;
  };
  struct Row {
    std::string key;
    const PropertyArray* intervals;
    std::optional<HistogramCounters> histogram{};
    DistributionStats statistics{};
    std::size_t pending = 0;  ///< values that have been read but not counted
  };
  static constexpr std::size_t kMaxRows = 8;
  /// Not a power of two, so that the rows begin in different sets of the processor's cache.
  static constexpr std::size_t kMaxPending = 2040;

  static std::optional<HistogramCounters> allocateCounters(const PropertyArray& intervals,
                                                           const std::string& key);
  double* valuesOf(const Row& row) {
    return &_values[static_cast<std::size_t>(&row - _rows.data()) * kMaxPending];
  }
  void countPending();

  PropertyDict& _distributions;
  PropertyDict& _histograms;
  std::vector<Row> _rows;
  std::unique_ptr<double[]> _values =
      std::make_unique_for_overwrite<double[]>(kMaxRows * kMaxPending);
};

}  // namespace vesprun
