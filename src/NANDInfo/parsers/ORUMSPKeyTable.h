#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "NANDInfo/tables/KnownNames.h"

namespace vesprun {

/// A statistic of the MSP buffer. The top four bits of its key are its group, the others its index
/// in the group.
struct ORUMSPKey {
  std::uint16_t key;
  std::string_view name;    ///< five names have two keys each
  std::uint16_t count = 1;  ///< elements

  static constexpr std::uint32_t groupOf(std::uint16_t key) { return key >> 12; }
  static constexpr std::uint32_t indexOf(std::uint16_t key) { return key & 0xFFF; }

  /// Bytes of an element: the groups 1 and 2 hold 32-bit values, 3 and 4 64-bit values.
  constexpr std::uint32_t width() const { return groupOf(key) <= 2 ? 4 : 8; }
  constexpr std::uint32_t size() const { return count * width(); }
};

/// All known statistics, by ascending key.
extern const std::span<const ORUMSPKey> ORUMSPKeyTable;

/// The statistic with that key, or null. Takes constant time.
const ORUMSPKey* findORUMSPKey(std::uint16_t key);

/// The names of the elements of a row of the table.
KnownNames MSPNamesOf(const ORUMSPKey& row);

}  // namespace vesprun
