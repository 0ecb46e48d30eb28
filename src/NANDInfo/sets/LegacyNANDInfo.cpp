#include "NANDInfo/sets/LegacyNANDInfo.h"

#include <array>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/sets/NANDInfoDict.h"
#include "NANDInfo/sets/StatisticsGathering.h"
#include "NANDInfo/sets/StorageHealthFields.h"
#include "common/Calendar.h"
#include "platform/DictionaryHelpers.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

/// The parity of a hexadecimal digit; 0 for other characters, including lower-case letters.
std::uint8_t parityOf(std::uint8_t character) {
  if (character >= '0' && character <= '9') {
    return character & 1;
  }
  return character >= 'A' && character <= 'F' ? (character + 1) & 1 : 0;
}

}  // namespace

bool NandInfoShouldLogAllToEH() {
  std::array<std::uint8_t, 100> session{};
  std::size_t length = 0;
  if (platform().kernel().sysctlbyname("kern.bootsessionuuid", session, length) != 0) {
    return false;
  }
  return (daysSince1970(platform().clock().now()) & 1) == parityOf(session[0]);
}

PropertyDict gatherNANDInfo() {
  nand_exporter_t* exporter = nullptr;
  ORUStatsContext context;
  if (!GatherNANDStats(exporter, context)) {
    return {{std::string(kNANDInfoErrorKey), "1"},
            {std::string(kNANDInfoErrorMessageKey), "Unable to parse buffer"}};
  }
  PropertyDict info = CreateNANDInfoDict(context, false);
  const PropertyDict purgeable = getReclaimerInfo();
  copyField(purgeable, "HLT_Reclaimer_totalPurgeable", info,
            "com.quill.NANDInfo.Reclaimer.TotalPurgeableBytes");
  copyField(purgeable, "HLT_Reclaimer_totalNonPurgeable", info,
            "com.quill.NANDInfo.Reclaimer.TotalNonPurgeableBytes");
  exporter->releaseStats(context);
  return info;
}

std::optional<PropertyDict> gatherNANDInfoForDailyLog() {
  if (NandInfoShouldLogAllToEH()) {
    return PropertyDict();
  }
  logMessage(LogLevel::Default, "NANDInfo: CopyNANDInfoWithOptions: obtaining FTL data for TLYD\n");
  std::optional<PropertyDict> info = gatherNANDInfo();
  if (info->empty()) {
    SetAPIErrorMessage("CopyNANDInfoWithOptions: Unable to get FTL Fields for TLYD");
    logMessage(LogLevel::Default,
               "NANDInfo: CopyNANDInfoWithOptions: Unable to get FTL Fields for TLYD\n");
    info.reset();
  }
  logMessage(LogLevel::Default, "NANDInfo: CopyNANDInfoWithOptions: returning TLYD dictionary\n");
  return info;
}

void addNANDInfo(PropertyDict& info) {
  nand_exporter_t* exporter = nullptr;
  ORUStatsContext context;
  if (GatherNANDStats(exporter, context)) {
    for (const auto& [key, value] : CreateNANDInfoDict(context, true)) {
      CopyDictionary(key, value, info);
    }
    exporter->releaseStats(context);
  }
}

}  // namespace vesprun
