#include "Comparison.h"

#include <algorithm>
#include <boost/math/distributions/students_t.hpp>
#include <cmath>
#include <tuple>

#include "Statistics.h"

namespace vesprun {
namespace {

// Means of merged distributions that differ by less are equal but for rounding.
constexpr long double kRounding = 1e-12L;

/// The means of a group of devices.
struct Group {
  long double count = 0;
  long double mean = 0;
  long double variance = 0;
};

bool areEqual(double left, double right, KeyKind kind) {
  return left == right ||
         (kind == KeyKind::Distribution &&
          std::abs(left - right) <= kRounding * std::max(std::abs(left), std::abs(right)));
}

Group groupOf(const std::vector<double>& means, KeyKind kind) {
  Group group;
  group.count = static_cast<long double>(means.size());
  Sum sum;
  for (const double mean : means) {
    sum.add(mean);
  }
  group.mean = sum.value() / group.count;
  const auto [lowest, greatest] = std::minmax_element(means.begin(), means.end());
  if (!areEqual(*lowest, *greatest, kind)) {
    for (const double mean : means) {
      group.variance += (mean - group.mean) * (mean - group.mean);
    }
    group.variance /= group.count - 1;
  }
  return group;
}

/// Welch's test: are the means of two groups equal, whatever their variances?
double probability(const Group& a, const Group& b, KeyKind kind) {
  const long double ofA = a.variance / a.count;
  const long double ofB = b.variance / b.count;
  if (ofA + ofB == 0) {
    return areEqual(static_cast<double>(a.mean), static_cast<double>(b.mean), kind) ? 1 : 0;
  }
  const auto t = static_cast<double>((b.mean - a.mean) / std::sqrt(ofA + ofB));
  // As parts of the whole: their squares could be too small for a number.
  const long double partOfA = ofA / (ofA + ofB);
  const long double partOfB = ofB / (ofA + ofB);
  const auto freedom = static_cast<double>(
      1 / (partOfA * partOfA / (a.count - 1) + partOfB * partOfB / (b.count - 1)));
  if (!std::isfinite(t)) {
    return 0;
  }
  const boost::math::students_t distribution(freedom);
  return std::min(1.0, 2 * boost::math::cdf(boost::math::complement(distribution, std::abs(t))));
}

}  // namespace

std::vector<ComparedKey> compareKeys(FleetStore& store, const ComparedGroups& groups,
                                     std::uint64_t least) {
  std::vector<ComparedKey> keys;
  store.visitMeans(groups, [&](KeyMeans&& found) {
    if (found.means[0].size() < least || found.means[1].size() < least) {
      return;
    }
    for (auto& means : found.means) {
      std::sort(means.begin(), means.end());  // the order of arrival changes no bit
    }
    const Group a = groupOf(found.means[0], found.kind);
    const Group b = groupOf(found.means[1], found.kind);
    keys.push_back({std::move(found.key), found.kind, found.means[0].size(), found.means[1].size(),
                    static_cast<double>(a.mean), static_cast<double>(b.mean),
                    probability(a, b, found.kind), 1});
  });
  std::sort(keys.begin(), keys.end(), [](const ComparedKey& left, const ComparedKey& right) {
    return std::tie(left.p, left.key, left.kind) < std::tie(right.p, right.key, right.kind);
  });
  double q = 1;
  for (std::size_t rank = keys.size(); rank > 0; --rank) {
    ComparedKey& key = keys[rank - 1];
    q = std::min(q, key.p * static_cast<double>(keys.size()) / static_cast<double>(rank));
    key.q = q;
  }
  return keys;
}

}  // namespace vesprun
