#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "FleetStore.h"

namespace vesprun {

/// How a key differs between two groups of devices.
struct ComparedKey {
  std::string key;
  KeyKind kind = KeyKind::Scalar;
  std::uint64_t devicesA = 0;
  std::uint64_t devicesB = 0;
  double meanA = 0;
  double meanB = 0;
  double p = 1;  ///< Welch's test, two-sided
  double q = 1;  ///< Benjamini-Hochberg, over all keys compared
};

/// Compares the keys that at least `least` devices have in each group, by `p`, then key, then kind.
std::vector<ComparedKey> compareKeys(FleetStore& store, const ComparedGroups& groups,
                                     std::uint64_t least);

}  // namespace vesprun
