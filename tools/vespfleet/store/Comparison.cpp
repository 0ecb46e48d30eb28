#include "Comparison.h"

#include <algorithm>
#include <boost/math/distributions/students_t.hpp>
#include <cmath>
#include <tuple>

namespace vesprun {
namespace {

/// Welch's test: are the means of two groups equal, whatever their variances?
double probability(const Spread& a, const Spread& b, KeyKind kind) {
  const auto countA = static_cast<long double>(a.count);
  const auto countB = static_cast<long double>(b.count);
  const long double ofA = a.variance / countA;
  const long double ofB = b.variance / countB;
  if (ofA + ofB == 0) {
    return areEqual(static_cast<double>(a.mean), static_cast<double>(b.mean),
                    kind == KeyKind::Distribution)
               ? 1
               : 0;
  }
  const auto t = static_cast<double>((b.mean - a.mean) / std::sqrt(ofA + ofB));
  // As parts of the whole: their squares could be too small for a number.
  const long double partOfA = ofA / (ofA + ofB);
  const long double partOfB = ofB / (ofA + ofB);
  const auto freedom = static_cast<double>(
      1 / (partOfA * partOfA / (countA - 1) + partOfB * partOfB / (countB - 1)));
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
  store.visitSpreads(groups, [&](KeySpreads&& found) {
    const auto& [a, b] = found.groups;
    if (a.count >= least && b.count >= least) {
      keys.push_back({std::move(found.key), found.kind, a.count, b.count,
                      static_cast<double>(a.mean), static_cast<double>(b.mean),
                      probability(a, b, found.kind), 1});
    }
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
