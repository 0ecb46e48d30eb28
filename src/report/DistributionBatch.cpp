#include "report/DistributionBatch.h"

#include <algorithm>
#include <new>
#include <span>
#include <utility>

#include "platform/Platform.h"

namespace vesprun {

std::optional<DistributionBatch::HistogramCounters> DistributionBatch::allocateCounters(
    const PropertyArray& intervals, const std::string& key) {
  logMessage(LogLevel::Debug, "Treating key %s as a histogram", key.c_str());
  try {
    return HistogramCounters(intervals);
  } catch (const std::bad_alloc&) {
    logMessage(LogLevel::Default,
               "Couldn't allocate histCounts for key %s. Will not calculate histogram values",
               key.c_str());
    return std::nullopt;
  }
}

void DistributionBatch::add(TBHistoryDistributionEnumerator& values, std::string_view key,
                            const DistributionOptions& options) {
  _rows.push_back({std::string(key), options.intervals});
  Row& row = _rows.back();
  if (row.intervals != nullptr) {
    row.histogram = allocateCounters(*row.intervals, row.key);
  }
  double* const read = valuesOf(row);
  while (const std::size_t count =
             values.getNextValues({read + row.pending, kMaxPending - row.pending})) {
    row.pending += count;
    if (row.pending == kMaxPending) {
      countPending();
    }
  }
  if (_rows.size() == kMaxRows) {
    finish();
  }
}

void DistributionBatch::countPending() {
  std::size_t most = 0;
  for (const Row& row : _rows) {
    most = std::max(most, row.pending);
  }
  for (std::size_t i = 0; i < most; ++i) {
    const double* value = &_values[i];
    for (Row& row : _rows) {
      if (i < row.pending) {
        row.statistics.add(*value);
      }
      value += kMaxPending;
    }
  }
  for (Row& row : _rows) {
    if (row.histogram) {
      for (const double value : std::span(valuesOf(row), row.pending)) {
        ++row.histogram
              ->counts[determineHistBucketForValueWithIntervals(value, row.histogram->boundaries)];
      }
    }
    row.pending = 0;
  }
}

void DistributionBatch::finish() {
  countPending();
  for (const Row& row : _rows) {
    std::optional<PropertyDict> histogram =
        row.histogram
            ? histogramDictForIntervalsWithHistCounts(*row.intervals, row.histogram->counts)
            : std::nullopt;
    if (histogram) {
      _histograms.set(row.key, *std::move(histogram));
    } else if (row.histogram) {
      _histograms.remove(row.key);
    }
    _distributions.set(row.key, row.statistics.toArray());
  }
  _rows.clear();
}

}  // namespace vesprun
