// The functions that other programs call. Each calls the function that does the work, and records
// an error where that throws. The project's own code calls the latter, except in the table of entry
// points.

#include <exception>
#include <type_traits>

#include "NANDInfo/controller/Controller.h"
#include "NANDInfo/events/ExtractionSteps.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/sets/HealthFigures.h"
#include "NANDInfo/sets/LegacyNANDInfo.h"
#include "NANDInfo/sets/MagazineInfo.h"
#include "NANDInfo/sets/VMFreezerInfo.h"
#include "NANDInfo/sets/WhitelistedFields.h"
#include "NANDInfo/structuredlog/StructuredLogGlobals.h"
#include "platform/Platform.h"
#include "vesprun/ContentDeletion.h"
#include "vesprun/CopyNANDInfo.h"
#include "vesprun/EventExtraction.h"
#include "vesprun/HealthSets.h"
#include "vesprun/Magazine.h"
#include "vesprun/StructuredLogState.h"
#include "vesprun/VMFreezer.h"
#include "vesprun/WhitelistedFieldSets.h"

namespace vesprun {
namespace {

/// Without an open device, or when `work` throws (out of memory), the error is recorded and the
/// result is empty.
template <typename Work>
std::invoke_result_t<Work&> runEntryPoint(const char* operation, Work work) noexcept {
  if (!platformIsInstalled()) {
    SetAPIErrorMessage("%s: no device is open", operation);
    return std::invoke_result_t<Work&>();
  }
  try {
    return work();
  } catch (const std::exception& failure) {
    SetAPIErrorMessage("%s: %s", operation, failure.what());
    return std::invoke_result_t<Work&>();
  }
}

}  // namespace

PropertyDict CopyNANDInfo() noexcept { return runEntryPoint(__func__, gatherNANDInfo); }

std::optional<PropertyDict> CopyNANDInfoWithOptions(const PropertyDict& /*options*/) noexcept {
  return runEntryPoint(__func__, gatherNANDInfoForDailyLog);
}

void DumpNANDInfo(PropertyDict& info) noexcept {
  runEntryPoint(__func__, [&] { addNANDInfo(info); });
}

std::optional<PropertyDict> CopyNANDFTLInfo(bool useStatKeyParser, std::uint32_t enabled) noexcept {
  return runEntryPoint(
      __func__, [&] { return enabled != 0 ? gatherFTLInfo(useStatKeyParser) : std::nullopt; });
}

PropertyDict CopyWhitelistedNANDFTLInfo(bool round) noexcept {
  return runEntryPoint(__func__, [round] { return gatherWhitelistedFTLInfo(round); });
}

std::optional<PropertyDict> CopyWhitelistedNANDFTLCountersInfo() noexcept { return std::nullopt; }

PropertyDict CopyWhitelistedNANDMSPInfo(bool round) noexcept {
  return runEntryPoint(__func__, [round] { return gatherWhitelistedMSPInfo(round); });
}

PropertyDict CopyWhitelistedStorageStats(bool round) noexcept {
  return runEntryPoint(__func__, [round] { return gatherWhitelistedStorageStats(round); });
}

PropertyDict CopyVMFreezerNANDInfo() noexcept {
  return runEntryPoint(__func__, gatherVMFreezerInfo);
}

PropertyDict CopySMagNANDFTLInfo(std::uint64_t hours, std::uint32_t deltaWanted,
                                 std::uint32_t mode) noexcept {
  return runEntryPoint(__func__, [&] { return gatherMagazineInfo(hours, deltaWanted != 0, mode); });
}

PropertyDict CopySMagNANDFTLCustomHistoryInfo(std::uint32_t skipHistory) noexcept {
  return runEntryPoint(__func__, [&] { return gatherMagazineHistory(skipHistory != 0); });
}

PropertyDict CopyTendmarkNANDInfo() noexcept { return runEntryPoint(__func__, gatherTendmarkInfo); }

PropertyDict CopyOTANANDInfo() noexcept { return runEntryPoint(__func__, gatherOTAInfo); }

PropertyDict CopyInternalLabNANDInfo() noexcept {
  return runEntryPoint(__func__, gatherInternalLabInfo);
}

std::optional<PropertyDict> NandInfoExtractToEH_runAllSteps(std::uint64_t /*context*/,
                                                            bool allowMonthly,
                                                            std::uint32_t collectResults,
                                                            std::uint32_t firstStep) noexcept {
  return runEntryPoint(
      __func__, [&] { return runExtractionSteps(allowMonthly, collectResults != 0, firstStep); });
}

bool NandRecommendsContentDeletion() noexcept {
  return runEntryPoint(__func__, [] { return Controller().recommendsContentDeletion(); });
}

bool openORUConnection(ORUConnection& connection) noexcept {
  connection = {};
  const bool isOpen = runEntryPoint(__func__, [&] { return openConnection(connection); });
  if (!isOpen) {
    closeORUConnection(connection);
  }
  return isOpen;
}

void closeORUConnection(ORUConnection& connection) noexcept {
  runEntryPoint(__func__, [&] { closeAndForget(connection.connection, connection.service); });
  connection.connection = 0;
  connection.service = 0;
}

void SetForceCollection(bool force) noexcept { gForceCollectionSet = force ? 1 : 0; }
bool NeedsValidityList() noexcept { return gNeedValidityList != 0; }
double CurrentUserWriteAmplification() noexcept { return gCurrentUserWamp; }
double CurrentSystemWriteAmplification() noexcept { return gCurrentSysWamp; }

}  // namespace vesprun
