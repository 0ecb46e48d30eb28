#include "Statistics.h"

#include <algorithm>
#include <cmath>
#include <compare>
#include <cstdlib>
#include <limits>

namespace vesprun {
namespace {

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

bool isBefore(const Statistics& left, const Statistics& right) {
  if (left.count != right.count) {
    return left.count < right.count;
  }
  for (const auto member :
       {&Statistics::mean, &Statistics::deviations, &Statistics::minimum, &Statistics::maximum}) {
    if (const auto order = std::strong_order(left.*member, right.*member); order != 0) {
      return order < 0;
    }
  }
  return false;
}

/// The boundaries in a label such as "(10, 100]".
struct Bucket {
  double lower = 0;
  double upper = 0;
};

std::optional<Bucket> bucketOf(const std::string& label) {
  if (label.size() < 2 || label.front() != '(') {
    return std::nullopt;
  }
  char* end = nullptr;
  Bucket bucket;
  bucket.lower = std::strtod(label.c_str() + 1, &end);
  if (*end != ',') {
    return std::nullopt;
  }
  const char* second = end + 1;
  bucket.upper = std::strtod(second, &end);
  const bool closed = end != second && (*end == ']' || *end == ')') && end[1] == '\0';
  return closed && bucket.lower <= bucket.upper ? std::optional(bucket) : std::nullopt;
}

}  // namespace

// With the mean m of all n values, the squared deviations from it of a part of k values around the
// mean p add up to that part's own ones and k (p - m)².
Statistics mergedStatistics(std::vector<Statistics> parts) {
  std::sort(parts.begin(), parts.end(), isBefore);
  Statistics merged = parts.front();
  merged.count = 0;
  Sum values;
  for (const Statistics& part : parts) {
    merged.minimum = std::min(merged.minimum, part.minimum);
    merged.maximum = std::max(merged.maximum, part.maximum);
    merged.count += part.count;
    values.add(static_cast<long double>(part.mean) * static_cast<long double>(part.count));
  }
  if (parts.size() == 1) {
    return merged;  // k p / k may be another double than p
  }
  const auto count = static_cast<long double>(merged.count);
  const long double mean = values.value() / count;
  Sum deviations;
  Sum distances;
  for (const Statistics& part : parts) {
    const long double distance = part.mean - mean;
    const long double weighted = static_cast<long double>(part.count) * distance;
    distances.add(weighted);
    deviations.add(part.deviations);
    deviations.add(weighted * distance);
  }
  // What rounding took from the mean shows in the distances from it.
  const long double rest = distances.value() / count;
  deviations.add(-count * rest * rest);
  merged.mean = static_cast<double>(mean + rest);
  merged.deviations = static_cast<double>(deviations.value());
  return merged;
}

Summary summaryOf(std::vector<std::int64_t> values) {
  std::sort(values.begin(), values.end());
  Summary summary{values.front(), values.back(), 0, {}};
  // Quotients and remainders apart: neither of their sums can overflow.
  const auto count = static_cast<std::int64_t>(values.size());
  std::int64_t quotients = 0;
  std::int64_t remainders = 0;
  for (const std::int64_t value : values) {
    quotients += value / count;
    remainders += value % count;
    quotients += remainders / count;
    remainders %= count;
  }
  summary.mean =
      static_cast<double>(static_cast<long double>(quotients) +
                          static_cast<long double>(remainders) / static_cast<long double>(count));
  for (const int percent : kPercents) {
    const std::size_t rank = (static_cast<std::size_t>(percent) * values.size() + 99) / 100;
    summary.quantiles.push_back(values[rank - 1]);
  }
  return summary;
}

std::vector<std::string> labelsInOrder(const Histogram& histogram, bool& overlap) {
  struct Labelled {
    Bucket bucket;
    std::string label;
  };
  std::vector<Labelled> buckets;
  std::vector<std::string> others;
  for (const auto& [label, count] : histogram) {
    if (const auto bucket = bucketOf(label)) {
      buckets.push_back({*bucket, label});
    } else {
      others.push_back(label);
    }
  }
  std::stable_sort(buckets.begin(), buckets.end(), [](const auto& left, const auto& right) {
    return std::pair(left.bucket.lower, left.bucket.upper) <
           std::pair(right.bucket.lower, right.bucket.upper);
  });
  std::vector<std::string> labels;
  double reached = -std::numeric_limits<double>::infinity();
  for (Labelled& entry : buckets) {
    overlap = overlap || entry.bucket.lower < reached;
    reached = std::max(reached, entry.bucket.upper);
    labels.push_back(std::move(entry.label));
  }
  labels.insert(labels.end(), others.begin(), others.end());
  return labels;
}

}  // namespace vesprun
