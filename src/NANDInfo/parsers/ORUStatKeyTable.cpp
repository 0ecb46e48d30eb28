#include "NANDInfo/parsers/ORUStatKeyTable.h"

#include <algorithm>
#include <array>
#include <functional>

#include "NANDInfo/tables/KnownNamesOf.h"

namespace vesprun {

namespace {

constexpr auto kStatKeys = std::to_array<ORUStatKey>({
#include "NANDInfo/parsers/ORUStatKeys.inc"
});

constexpr std::size_t kMaxKnownId = kStatKeys.back().id;
constexpr std::uint16_t kNoRow = 0xFFFF;

constexpr std::array<std::uint16_t, kMaxKnownId + 1> kRowOfId = [] {
  std::array<std::uint16_t, kMaxKnownId + 1> rows{};
  rows.fill(kNoRow);
  for (std::size_t row = 0; row < kStatKeys.size(); ++row) {
    rows[kStatKeys[row].id] = static_cast<std::uint16_t>(row);
  }
  return rows;
}();

static_assert(std::ranges::adjacent_find(kStatKeys, std::ranges::greater_equal(),
                                         &ORUStatKey::id) == kStatKeys.end());

constexpr char kBaseSeparator[] = "";
constexpr char kFTLSeparator[] = "_";

}  // namespace

constinit const std::span<const ORUStatKey> ORUStatKeyTable = kStatKeys;

KnownNames baseNamesOf(const ORUStatKey& row) {
  return KnownNamesOf<kStatKeys, kBaseSeparator>::of(row);
}

KnownNames FTLNamesOf(const ORUStatKey& row) {
  return KnownNamesOf<kStatKeys, kFTLSeparator>::of(row);
}

const ORUStatKey* findORUStatKey(std::uint32_t id) {
  const std::uint16_t row = id < kRowOfId.size() ? kRowOfId[id] : kNoRow;
  return row != kNoRow ? &kStatKeys[row] : nullptr;
}

}  // namespace vesprun
