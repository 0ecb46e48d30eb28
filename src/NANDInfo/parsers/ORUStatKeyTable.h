#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "NANDInfo/tables/KnownNames.h"

namespace vesprun {

/// A statistic that the storage controller exports in its base and FTL buffers.
struct ORUStatKey {
  std::uint16_t id;
  std::string_view name;    ///< goes into reports letter for letter
  std::uint16_t count = 1;  ///< 1 for a single value, else the number of elements of the array

  constexpr bool isArray() const { return count > 1; }
};

/// All known statistics, by ascending id.
extern const std::span<const ORUStatKey> ORUStatKeyTable;

/// The statistic with that id, or null. Takes constant time.
const ORUStatKey* findORUStatKey(std::uint32_t id);

// The names of the elements of a row of the table, which in the FTL buffer have an underscore
// before the index.
KnownNames baseNamesOf(const ORUStatKey& row);
KnownNames FTLNamesOf(const ORUStatKey& row);

}  // namespace vesprun
