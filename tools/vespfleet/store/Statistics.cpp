#include "Statistics.h"

#include <algorithm>
#include <cmath>
#include <compare>
#include <cstdlib>
#include <functional>
#include <limits>

namespace vesprun {
namespace {

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

double meanOf(Int128 sum, std::int64_t count) {
  return static_cast<double>(static_cast<long double>(sum / count) +
                             static_cast<long double>(sum % count) /
                                 static_cast<long double>(count));
}

Summary summaryOf(std::vector<DeviceValue> values, std::uint64_t least) {
  // The lowest value of each device and the greatest: a device counts once, however many days.
  std::sort(values.begin(), values.end(), [](const DeviceValue& left, const DeviceValue& right) {
    return std::pair(left.device, left.value) < std::pair(right.device, right.value);
  });
  std::vector<std::int64_t> lowest;
  std::vector<std::int64_t> greatest;
  std::vector<std::int64_t> all;
  all.reserve(values.size());
  Int128 sum = 0;
  for (std::size_t i = 0; i < values.size(); ++i) {
    if (i == 0 || values[i].device != values[i - 1].device) {
      lowest.push_back(values[i].value);
    }
    if (i + 1 == values.size() || values[i].device != values[i + 1].device) {
      greatest.push_back(values[i].value);
    }
    all.push_back(values[i].value);
    sum += values[i].value;
  }
  Summary summary{meanOf(sum, static_cast<std::int64_t>(all.size())), {}};
  std::sort(all.begin(), all.end());
  std::sort(lowest.begin(), lowest.end());
  std::sort(greatest.begin(), greatest.end(), std::greater<>());
  for (const int percent : kPercents) {
    const std::size_t rank = (static_cast<std::size_t>(percent) * all.size() + 99) / 100;
    const std::int64_t value = all[rank - 1];
    const bool isTold = value >= lowest.at(least - 1) && value <= greatest.at(least - 1);
    summary.quantiles.push_back(isTold ? std::optional(value) : std::nullopt);
  }
  return summary;
}

bool areEqual(double left, double right, bool areMerged) {
  constexpr double kRounding = 1e-12;
  return left == right || (areMerged && std::abs(left - right) <=
                                            kRounding * std::max(std::abs(left), std::abs(right)));
}

Spread spreadOf(std::vector<double> values, bool areMerged) {
  Spread spread{values.size(), 0, 0};
  if (values.empty()) {
    return spread;
  }
  std::sort(values.begin(), values.end());  // the order of arrival changes no bit
  const auto count = static_cast<long double>(values.size());
  Sum sum;
  for (const double value : values) {
    sum.add(value);
  }
  spread.mean = sum.value() / count;
  if (!areEqual(values.front(), values.back(), areMerged)) {
    for (const double value : values) {
      spread.variance += (value - spread.mean) * (value - spread.mean);
    }
    spread.variance /= count - 1;
  }
  return spread;
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
