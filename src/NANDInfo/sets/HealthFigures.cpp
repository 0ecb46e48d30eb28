#include "NANDInfo/sets/HealthFigures.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/sets/FilteredDict.h"
#include "NANDInfo/sets/StatisticsGathering.h"

namespace vesprun {
namespace {

constexpr const char* kMaxPercentageNANDUsed = "com.quill.NANDInfo.Health.MaxPercentageNANDUsed";
constexpr const char* kMaxE2EErrors = "com.quill.NANDInfo.Health.MaxE2EErrors";
constexpr const char* kHostReadErrors = "com.quill.NANDInfo.Health.HostReadErrors";
constexpr const char* kNumGrownBadBlocks = "com.quill.NANDInfo.Health.NumGrownBadBlocks";
constexpr const char* kSpareAvailablePercent = "com.quill.NANDInfo.Health.SpareAvailablePercent";
constexpr const char* kNumDieFailures = "com.quill.NANDInfo.Health.NumDieFailures";
constexpr const char* kIsNANDRetirable = "com.quill.NANDInfo.Health.IsNANDRetirable";

constexpr unsigned kE2EErrorCounters = 12;

constexpr auto kTendmarkKeys = std::to_array<FieldRange>(
    {kMaxPercentageNANDUsed, kHostReadErrors, kMaxE2EErrors, kNumGrownBadBlocks, kNumDieFailures});
constinit const FieldTable kTendmarkFields = fieldTable<kTendmarkKeys>();

constexpr auto kOTAKeys = std::to_array<FieldRange>(
    {kMaxPercentageNANDUsed, kHostReadErrors, kMaxE2EErrors, kNumGrownBadBlocks});
constinit const FieldTable kOTAFields = fieldTable<kOTAKeys>();

constexpr auto kInternalLabKeys =
    std::to_array<FieldRange>({kMaxPercentageNANDUsed, kHostReadErrors, kMaxE2EErrors,
                               kSpareAvailablePercent, kNumGrownBadBlocks});
constinit const FieldTable kInternalLabFields = fieldTable<kInternalLabKeys>();

/// As a signed 32-bit number; 0 when negative or missing.
std::int32_t atLeastZero(const PropertyDict& fields, std::string_view name) {
  const Number* number = fields.findNumber(name);
  return number != nullptr ? std::max(number->asInt32(), 0) : 0;
}

std::int32_t maxPercentageUsed(const PropertyDict& ftl) {
  return std::max({atLeastZero(ftl, "fwUpdatesPercentUsed"), atLeastZero(ftl, "slcPercentUsed"),
                   atLeastZero(ftl, "percentUsed")});
}

std::int32_t maxE2EErrors(const PropertyDict& ftl) {
  std::int32_t most = 0;
  for (unsigned i = 0; i < kE2EErrorCounters; ++i) {
    most = std::max(most, atLeastZero(ftl, "E2EDPErrorCounters_" + std::to_string(i)));
  }
  return most;
}

std::int64_t hostReadErrors(const PropertyDict& ftl) {
  const Number* isQNS1 = ftl.findNumber("com.quill.NANDInfo.IsQNS1Controller");
  if (isQNS1 == nullptr) {
    return 0;
  }
  const char* const errors = isQNS1->asInt64() != 0 ? "ueccReads" : "raidSmartErrors";
  return std::max<std::int64_t>(ftl.integerOr(errors, 0), 0);
}

bool isRetirable(const PropertyDict& health) {
  const Number* spare = health.findNumber(kSpareAvailablePercent);
  const Number* used = health.findNumber(kMaxPercentageNANDUsed);
  return spare != nullptr && used != nullptr && spare->asInt64() >= 0 && used->asInt64() >= 0 &&
         (spare->asInt64() < 100 || used->asInt64() >= 100);
}

}  // namespace

PropertyDict gatherNANDHealthInfo() {
  const std::optional<PropertyDict> ftl = gatherORUFTLData(false, true, 0);
  if (!ftl) {
    SetAPIErrorMessage("gatherNANDHealthInfo: Unable to get FTL fields");
    return {};
  }
  return {{kMaxPercentageNANDUsed, maxPercentageUsed(*ftl)},
          {kMaxE2EErrors, maxE2EErrors(*ftl)},
          {kHostReadErrors, hostReadErrors(*ftl)},
          {kNumGrownBadBlocks, ftl->integerOr("numGrownBad", -1)},
          {kSpareAvailablePercent, ftl->integerOr("spareAvailablePercent", -1)},
          {kNumDieFailures, ftl->integerOr("numDieFailures", -1)}};
}

PropertyDict gatherTendmarkInfo() {
  PropertyDict set = CreateFilteredDict(gatherNANDHealthInfo(), &kTendmarkFields);
  set.set(kAPIErrorMessageKey, GetAPIErrorMessage());
  return set;
}

PropertyDict gatherOTAInfo() { return CreateFilteredDict(gatherNANDHealthInfo(), &kOTAFields); }

PropertyDict gatherInternalLabInfo() {
  PropertyDict set = CreateFilteredDict(gatherNANDHealthInfo(), &kInternalLabFields);
  set.set(kIsNANDRetirable, std::int32_t{isRetirable(set)});
  set.set(kAPIErrorMessageKey, GetAPIErrorMessage());
  return set;
}

}  // namespace vesprun
