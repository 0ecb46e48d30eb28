#include "NANDInfo/sets/MagazineInfo.h"

#include <array>
#include <optional>
#include <string>
#include <string_view>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/sets/StatisticsGathering.h"
#include "NANDInfo/sets/StorageHealthFields.h"
#include "NANDInfo/tables/MagazineFields.h"
#include "common/Calendar.h"
#include "platform/DictionaryHelpers.h"

namespace vesprun {
namespace {

constexpr std::string_view kMetaKey = "magazineInstanceMeta";
constexpr std::string_view kTimeStampKey = "HLT_magazineTimeStamp";

/// The snapshot of `hours` hours ago (0: the newest), with its time stamp in seconds if it carries
/// the magazine's own data. Nothing, with the error recorded, on failure.
std::optional<PropertyDict> copyMagazineSnapshot(std::uint64_t hours) {
  std::optional<PropertyDict> snapshot =
      gatherORUFTLData(false, false, static_cast<std::uint32_t>(hours));
  if (snapshot) {
    if (const Number* meta = snapshot->findNumber(kMetaKey)) {
      snapshot->set(kTimeStampKey, meta->asUInt64() >> 24 & 0xFFFF'FFFF);
    }
  }
  return snapshot;
}

void addFields(const PropertyDict& newest, const PropertyDict& old, bool asDeltas,
               std::uint32_t mode, PropertyDict& result) {
  const bool accumulating = mode == 0 || mode == 2;
  const bool instantaneous = mode == 1 || mode == 2;
  for (const auto& [name, value] : old) {
    const Number* newestNumber = newest.findNumber(name);
    const Number* oldNumber = value.number();
    if (newestNumber == nullptr || oldNumber == nullptr) {
      continue;
    }
    if (accumulating && PrivacyApprovedSMagNANDFTLCounters_Accum.contains(name)) {
      const double then = oldNumber->asDouble();
      result.set(name, asDeltas ? newestNumber->asDouble() - then : then);
    }
    if (instantaneous && PrivacyApprovedSMagNANDFTLCounters_Dynamic.contains(name)) {
      result.set(name, value);
    }
  }
}

void addDeltas(const PropertyDict& newest, const PropertyDict& old, bool deltaWanted,
               std::uint32_t mode, PropertyDict& result) {
  const Number* newestStamp = newest.findNumber(kTimeStampKey);
  const Number* oldStamp = old.findNumber(kTimeStampKey);
  if (newestStamp == nullptr || oldStamp == nullptr) {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas");
    return;
  }
  const double deltaDays =
      (newestStamp->asDouble() - oldStamp->asDouble()) / static_cast<double>(kSecondsPerDay);
  result.set("HLT_SM_deltaDays", deltaDays);
  addFields(newest, old, deltaWanted && deltaDays > 0, mode, result);
}

/// Adds `erases` / (`end` - `begin`) if all three are known.
void addAverageCycles(const Number* erases, const Number* begin, const Number* end,
                      std::string_view average, PropertyDict& result) {
  if (erases == nullptr || begin == nullptr || end == nullptr) {
    return;
  }
  const double bands = end->asDouble() - begin->asDouble();
  result.set(average, bands != 0 ? erases->asDouble() / bands : 0.0);
}

void addAverageCycles(PropertyDict& result) {
  const std::optional<PropertyDict> current = gatherORUFTLData(false, true, 0);
  if (!current) {
    return;
  }
  if (current->empty()) {
    SetAPIErrorMessage("CopySMagNANDFTLInfo: Unable to gather new delta fields");
    return;
  }
  const Number* userStart = current->findNumber("userPartitionStart");
  addAverageCycles(result.findNumber("bandErases"), userStart,
                   current->findNumber("numVirtualBlocks"), "averageTLCPECycles", result);
  addAverageCycles(result.findNumber("intermediateBandErases"),
                   current->findNumber("intermediatePartitionStart"), userStart,
                   "averageSLCPECycles", result);
}

constexpr std::uint64_t kHoursPerPeriod = 4;

constexpr std::array<std::string_view, 6> kHLT_instantaneous_gc_wamp_array{
    "HLT_instantaneous_gc_wamp_0", "HLT_instantaneous_gc_wamp_1", "HLT_instantaneous_gc_wamp_2",
    "HLT_instantaneous_gc_wamp_3", "HLT_instantaneous_gc_wamp_4", "HLT_instantaneous_gc_wamp_5"};

/// Did garbage collection write anything between the two? No, unless their stamps say that time
/// passed.
bool collectedGarbage(const PropertyDict& newer, const PropertyDict& older) {
  const Number* newerStamp = newer.findNumber(kTimeStampKey);
  const Number* olderStamp = older.findNumber(kTimeStampKey);
  const Number* newerWrites = newer.findNumber("gcWrites");
  const Number* olderWrites = older.findNumber("gcWrites");
  return newerStamp != nullptr && olderStamp != nullptr && newerWrites != nullptr &&
         olderWrites != nullptr && newerStamp->asUInt64() > olderStamp->asUInt64() &&
         newerWrites->asDouble() - olderWrites->asDouble() >= 1;
}

/// The invalid share of a band of that validity step; negative from step 31.
double invalidShare(unsigned step) { return 1 - 0.033 * step; }

/// Adds up bands along the validity curve until they make one free band. The step reached decides
/// how much had to be written.
double writeAmplification(const PropertyDict& snapshot) {
  constexpr unsigned kLastStep = 32;
  double missing = 1.0;
  unsigned step = 1;
  for (; step < kLastStep; ++step) {
    if (const Number* bands = snapshot.findNumber("vcurve_" + std::to_string(step))) {
      missing -= invalidShare(step) * bands->asDouble();
    }
    if (missing <= 0) {
      break;
    }
  }
  return 1 / invalidShare(step);
}

}  // namespace

PropertyDict gatherMagazineInfo(std::uint64_t hours, bool deltaWanted, std::uint32_t mode) {
  PropertyDict result{{std::string(kIsStatMagSupportedKey), std::int32_t{0}}};
  const std::optional<PropertyDict> newest = copyMagazineSnapshot(0);
  std::optional<PropertyDict> old = copyMagazineSnapshot(hours);
  if (newest) {
    if (newest->contains(kMetaKey)) {
      result.set(kIsStatMagSupportedKey,
                 GetNumberFromDictionarySafe(*newest, kIsStatMagSupportedKey));
    }
    if (old) {
      addDeltas(*newest, *old, deltaWanted, mode, result);
    }
  } else if (old) {
    result.merge(*std::move(old));
  }
  result.merge(gatherORUFTLOtherData(newest ? &*newest : nullptr));
  addAverageCycles(result);
  result.set(kAPIErrorMessageKey, GetAPIErrorMessage());
  return result;
}

PropertyDict gatherMagazineHistory(bool skipHistory) {
  std::optional<PropertyDict> newer = copyMagazineSnapshot(0);
  const Number* isSupported = newer ? newer->findNumber(kIsStatMagSupportedKey) : nullptr;
  if (isSupported != nullptr && isSupported->asInt32() == 0) {
    return {{std::string(kNANDInfoErrorMessageKey), GetAPIErrorMessage()}};
  }
  PropertyDict history;
  if (skipHistory) {
    return history;
  }
  std::uint64_t hours = 0;
  for (const std::string_view name : kHLT_instantaneous_gc_wamp_array) {
    hours += kHoursPerPeriod;
    std::optional<PropertyDict> older = copyMagazineSnapshot(hours);
    if (newer && older && collectedGarbage(*newer, *older)) {
      history.set(name, writeAmplification(*older));
    } else {
      history.set(name, std::int32_t{0});
    }
    newer = std::move(older);
  }
  return history;
}

}  // namespace vesprun
