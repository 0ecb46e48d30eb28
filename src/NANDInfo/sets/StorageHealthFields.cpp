#include "NANDInfo/sets/StorageHealthFields.h"

#include <algorithm>
#include <optional>
#include <string>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/sets/StatisticsGathering.h"
#include "NANDInfo/sets/VMFreezerInfo.h"
#include "NANDInfo/tables/FieldSets.h"
#include "platform/Platform.h"
#include "telemetry/DiskInfo.h"

namespace vesprun {
namespace {

constexpr unsigned kMSPs = 8;
constexpr unsigned kBackupBootBlocks = 3;

constexpr std::string_view kCopiedFields[] = {"averageSLCPECycles", "averageTLCPECycles",
                                              "hostWrites", "powerOnHours", "powerOnSeconds"};

const Number* findIndexed(const PropertyDict& fields, std::string_view stem, std::uint64_t index) {
  return fields.findNumber(std::string(stem) + std::to_string(index));
}

std::uint64_t mostBootBlockRefreshes(const PropertyDict& ftl) {
  std::uint64_t most = 0;
  for (unsigned i = 0; i < kMSPs; ++i) {
    std::uint64_t refreshes = 0;
    for (const char* stem : {"numBootBlockRefreshSuccess_", "numBootBlockRefreshFail_"}) {
      if (const Number* count = findIndexed(ftl, stem, i)) {
        refreshes += count->asUInt64();
      }
    }
    most = std::max(most, refreshes);
  }
  return most;
}

/// The failures of `blocks` boot blocks of each MSP, beginning `first` blocks after its primary
/// one.
std::uint64_t bootBlockFailures(const PropertyDict& ftl, std::string_view stem,
                                std::uint64_t blocksPerMSP, unsigned first, unsigned blocks) {
  std::int64_t sum = 0;
  for (unsigned msp = 0; msp < kMSPs; ++msp) {
    for (unsigned block = first; block < first + blocks; ++block) {
      if (const Number* failures = findIndexed(ftl, stem, msp * blocksPerMSP + block)) {
        sum += failures->asInt32();
      }
    }
  }
  return static_cast<std::uint64_t>(sum);
}

void addBootBlockFailures(const PropertyDict& ftl, std::uint64_t blocksPerMSP,
                          PropertyDict& fields) {
  constexpr std::string_view kFailures[] = {"mspBootBlockReadFails", "mspBootBlockProgFails",
                                            "mspBootBlockEraseFails"};
  const auto add = [&](std::string_view suffix, unsigned first, unsigned blocks) {
    for (const std::string_view failure : kFailures) {
      fields.set("HLT_" + std::string(failure) + std::string(suffix),
                 bootBlockFailures(ftl, std::string(failure) + '_', blocksPerMSP, first, blocks));
    }
  };
  add("_main", 0, 1);
  add("_backup", 1, kBackupBootBlocks);
}

void addFieldsOfFTL(const PropertyDict& ftl, PropertyDict& fields) {
  const Number* userStart = ftl.findNumber("userPartitionStart");
  const Number* intermediateStart = ftl.findNumber("intermediatePartitionStart");
  if (userStart != nullptr && intermediateStart != nullptr) {
    const std::int64_t size = std::int64_t{userStart->asInt32()} - intermediateStart->asInt32();
    fields.set("HLT_intermediatePartitionSize", static_cast<std::uint64_t>(size));
  }
  if (const Number* formatTime = ftl.findNumber("utilFormatTime")) {
    fields.set("HLT_formatWeeksSince2000", weeksSince2000(formatTime->asUInt32()));
  }
  for (const std::string_view name : kCopiedFields) {
    copyField(ftl, name, fields, "HLT_" + std::string(name));
  }
  fields.set("HLT_numBootBlockRefreshes_max", mostBootBlockRefreshes(ftl));
  if (const Number* blocksPerMSP = ftl.findNumber("mspBootBlockCountPerMsp")) {
    addBootBlockFailures(ftl, blocksPerMSP->asUInt64(), fields);
  }
}

constexpr unsigned kBootBlocks = 32;

constexpr auto kSources = std::to_array<FieldRange>({
    // clang-format off
    "userPartitionStart", "intermediatePartitionStart", "utilFormatTime", "averageSLCPECycles",
    "averageTLCPECycles", "hostWrites", "powerOnHours", "powerOnSeconds",
    {"numBootBlockRefreshSuccess_", 0, kMSPs - 1}, {"numBootBlockRefreshFail_", 0, kMSPs - 1},
    "mspBootBlockCountPerMsp", {"mspBootBlockReadFails_", 0, kBootBlocks - 1},
    {"mspBootBlockProgFails_", 0, kBootBlocks - 1}, {"mspBootBlockEraseFails_", 0, kBootBlocks - 1},
    // clang-format on
});

}  // namespace

constinit const FieldTable kSourcesOfOtherData = fieldTable<kSources>();

void copyField(const PropertyDict& from, std::string_view name, PropertyDict& to,
               std::string_view newName) {
  if (const PropertyValue* value = from.find(name)) {
    to.set(newName, *value);
  }
}

bool isInStoreDemoMode() {
  bool found = false;
  const bool demo = platform().preferences().LGSPreferencesGetBoolValue(
      "StoreDemoMode", "com.quill.demo-settings", found);
  return found && demo;
}

std::uint64_t weeksSince2000(std::uint64_t secondsSince1970) {
  constexpr std::uint64_t kStartOf2000 = 946'684'800;
  constexpr std::uint64_t kSecondsPerWeek = 604'800;
  return secondsSince1970 > kStartOf2000 ? (secondsSince1970 - kStartOf2000) / kSecondsPerWeek : 0;
}

PropertyDict getReclaimerInfo() {
  PropertyDict info;
  DeviceInformation& device = platform().deviceInformation();
  if (!device.reclaimerIsAvailable()) {
    return info;
  }
  const std::optional<PropertyDict> answer =
      device.ReclaimerCopyItemizedPurgeableSpaceWithInfo({{"RECLAIMER_VOLUME", "/private/var"}});
  if (!answer) {
    SetAPIErrorMessage(
        "getReclaimerInfo: unable to get output from ReclaimerCopyItemizedPurgeableSpaceWithInfo");
    return info;
  }
  if (!answer->contains("com.quill.NANDInfo.Reclaimer.Error")) {
    copyField(*answer, "RECLAIMER_TOTAL_AVAILABLE", info, "HLT_Reclaimer_totalPurgeable");
    copyField(*answer, "RECLAIMER_NONPURGEABLE_AMOUNT", info, "HLT_Reclaimer_totalNonPurgeable");
  }
  return info;
}

PropertyDict gatherORUFTLOtherData(const PropertyDict* ftl) {
  PropertyDict fields = getReclaimerInfo();
  fields.merge(gatherVMFreezerInfo());
  fields.merge(GetDiskInfo());
  fields.set("HLT_storeDemoMode", std::int32_t{isInStoreDemoMode()});
  if (ftl == nullptr) {
    SetAPIErrorMessage("gatherORUFTLOtherData: ftlDict is NULL");
    return fields;
  }
  addFieldsOfFTL(*ftl, fields);
  return fields;
}

PropertyDict gatherORUOtherData() {
  PropertyDict selected;
  PropertyDict sources;
  if (!gatherFTLFields(false, true, 0, [&sources](const FTLFields& ftl) {
        sources = CreateDictFromCxt(ftl.fields, &kSourcesOfOtherData);
      })) {
    SetAPIErrorMessage("gatherORUOtherData: Unable to get FTL counters");
    return selected;
  }
  const PropertyDict derived = gatherORUFTLOtherData(&sources);
  FTLStats4MSPStats.forEach(
      [&](std::string_view name, const FieldRange&) { copyField(derived, name, selected, name); });
  return selected;
}

}  // namespace vesprun
