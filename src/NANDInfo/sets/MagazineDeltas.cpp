#include "vesprun.h"

#include <optional>
#include <string>
#include <string_view>

#include "NANDInfo/parsers/APIErrorMessage.h"
#include "NANDInfo/parsers/DictionaryHelpers.h"
#include "NANDInfo/sets/FieldNumber.h"
#include "NANDInfo/sets/MagazineSnapshot.h"
#include "NANDInfo/sets/NANDInfo.h"
#include "NANDInfo/sets/StorageHealthFields.h"
#include "NANDInfo/tables/MagazineFields.h"
#include "common/Calendar.h"

namespace vesprun {
namespace {

/// Which of the fields are reported.
struct Selection {
  bool accumulating;
  bool instantaneous;

  explicit Selection(std::uint32_t mode)
      : accumulating(mode == 0 || mode == 2), instantaneous(mode == 1 || mode == 2) {}
};

void addFields(const PropertyDict& newest, const PropertyDict& old, bool asDeltas,
               Selection selection, PropertyDict& result) {
  for (const auto& [name, value] : old) {
    const Number* newestNumber = numberUnder(newest, name);
    const Number* oldNumber = value.number();
    if (newestNumber == nullptr || oldNumber == nullptr) {
      continue;
    }
    if (selection.accumulating && PrivacyApprovedSMagNANDFTLCounters_Accum.contains(name)) {
      const double then = oldNumber->asDouble();
      result.set(name, asDeltas ? newestNumber->asDouble() - then : then);
    }
    if (selection.instantaneous && PrivacyApprovedSMagNANDFTLCounters_Dynamic.contains(name)) {
      result.set(name, value);
    }
  }
}

void addDeltas(const PropertyDict& newest, const PropertyDict& old, bool deltaWanted,
               std::uint32_t mode, PropertyDict& result) {
  const Number* newestStamp = numberUnder(newest, kMagazineTimeStampKey);
  const Number* oldStamp = numberUnder(old, kMagazineTimeStampKey);
  if (newestStamp == nullptr || oldStamp == nullptr) {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas");
    return;
  }
  const double deltaDays =
      (newestStamp->asDouble() - oldStamp->asDouble()) / static_cast<double>(kSecondsPerDay);
  result.set("HLT_SM_deltaDays", deltaDays);
  addFields(newest, old, deltaWanted && deltaDays > 0, Selection(mode), result);
}

/// Adds `erases` / (`end` - `begin`) as `average` when all three are known.
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
  const Number* userStart = numberUnder(*current, "userPartitionStart");
  addAverageCycles(numberUnder(result, "bandErases"), userStart,
                   numberUnder(*current, "numVirtualBlocks"), "averageTLCPECycles", result);
  addAverageCycles(numberUnder(result, "intermediateBandErases"),
                   numberUnder(*current, "intermediatePartitionStart"), userStart,
                   "averageSLCPECycles", result);
}

}  // namespace

PropertyDict CopySMagNANDFTLInfo(std::uint64_t hours, std::uint32_t deltaWanted,
                                 std::uint32_t mode) {
  PropertyDict result{{std::string(kIsStatMagSupportedKey), std::int32_t{0}}};
  const std::optional<PropertyDict> newest = copyMagazineSnapshot(0);
  const std::optional<PropertyDict> old = copyMagazineSnapshot(hours);
  if (newest) {
    if (newest->contains(kMagazineMetaKey)) {
      result.set(kIsStatMagSupportedKey,
                 GetNumberFromDictionarySafe(*newest, kIsStatMagSupportedKey));
    }
    if (old) {
      addDeltas(*newest, *old, deltaWanted != 0, mode, result);
    }
  } else if (old) {
    result.merge(*old);
  }
  const PropertyDict derived = gatherORUFTLOtherData(newest ? &*newest : nullptr);
  if (derived.empty()) {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather HLT FTL fields");
  }
  result.merge(derived);
  addAverageCycles(result);
  result.set(kAPIErrorMessageKey, GetAPIErrorMessage());
  return result;
}

}  // namespace vesprun
