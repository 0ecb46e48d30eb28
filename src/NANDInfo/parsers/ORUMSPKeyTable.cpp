#include "NANDInfo/parsers/ORUMSPKeyTable.h"

#include <algorithm>
#include <array>
#include <functional>

#include "NANDInfo/tables/KnownNamesOf.h"

namespace vesprun {

namespace {

constexpr auto kMSPKeys = std::to_array<ORUMSPKey>({
#include "NANDInfo/parsers/ORUMSPKeys.inc"
});

constexpr std::size_t kGroups = 5;             // group 0 holds none
constexpr std::size_t kIndexesOfAGroup = 165;  // no index of any group is larger
constexpr std::uint8_t kNoMSPRow = 0xFF;

using Rows = std::array<std::array<std::uint8_t, kIndexesOfAGroup>, kGroups>;

constexpr Rows kRowOfKey = [] {
  Rows rows{};
  for (auto& group : rows) {
    group.fill(kNoMSPRow);
  }
  for (std::size_t row = 0; row < kMSPKeys.size(); ++row) {
    const std::uint16_t key = kMSPKeys[row].key;
    rows[ORUMSPKey::groupOf(key)][ORUMSPKey::indexOf(key)] = static_cast<std::uint8_t>(row);
  }
  return rows;
}();

static_assert(std::ranges::adjacent_find(kMSPKeys, std::ranges::greater_equal(), &ORUMSPKey::key) ==
              kMSPKeys.end());
static_assert(kMSPKeys.size() < kNoMSPRow);

constexpr char kMSPSeparator[] = "";

}  // namespace

constinit const std::span<const ORUMSPKey> ORUMSPKeyTable = kMSPKeys;

KnownNames MSPNamesOf(const ORUMSPKey& row) {
  return KnownNamesOf<kMSPKeys, kMSPSeparator>::of(row);
}

const ORUMSPKey* findORUMSPKey(std::uint16_t key) {
  const std::uint32_t group = ORUMSPKey::groupOf(key);
  const std::uint32_t index = ORUMSPKey::indexOf(key);
  if (group >= kGroups || index >= kIndexesOfAGroup) {
    return nullptr;
  }
  const std::uint8_t row = kRowOfKey[group][index];
  return row != kNoMSPRow ? &kMSPKeys[row] : nullptr;
}

}  // namespace vesprun
