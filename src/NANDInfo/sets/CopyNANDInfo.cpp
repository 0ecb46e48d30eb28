// The entry points that offer the NAND info, and what they are made from besides the statistics.

#include <array>
#include <string_view>
#include <utility>

#include "NANDInfo/parsers/APIErrorMessage.h"
#include "NANDInfo/parsers/DictionaryHelpers.h"
#include "NANDInfo/parsers/ORUStatsContext.h"
#include "NANDInfo/sets/NANDInfo.h"
#include "common/Calendar.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

/// The parity of the hexadecimal digit that the boot session identifier begins with; 0 for any
/// other character, lower-case letters included.
std::uint8_t parityOf(std::uint8_t character) {
  if (character >= '0' && character <= '9') {
    return character & 1;
  }
  return character >= 'A' && character <= 'F' ? (character + 1) & 1 : 0;
}

void copyIfPresent(const PropertyDict& from, std::string_view key, PropertyDict& to,
                   std::string_view newKey) {
  if (const PropertyValue* value = from.find(key)) {
    to.set(newKey, *value);
  }
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

PropertyDict getReclaimerInfo() {
  PropertyDict info;
  Reclaimer& reclaimer = platform().reclaimer();
  if (!reclaimer.isAvailable()) {
    return info;
  }
  const std::optional<PropertyDict> answer =
      reclaimer.ReclaimerCopyItemizedPurgeableSpaceWithInfo({{"RECLAIMER_VOLUME", "/private/var"}});
  if (!answer) {
    SetAPIErrorMessage(
        "getReclaimerInfo: unable to get output from ReclaimerCopyItemizedPurgeableSpaceWithInfo");
    return info;
  }
  if (!answer->contains("com.quill.NANDInfo.Reclaimer.Error")) {
    copyIfPresent(*answer, "RECLAIMER_TOTAL_AVAILABLE", info, "HLT_Reclaimer_totalPurgeable");
    copyIfPresent(*answer, "RECLAIMER_NONPURGEABLE_AMOUNT", info,
                  "HLT_Reclaimer_totalNonPurgeable");
  }
  return info;
}

PropertyDict CopyNANDInfo() {
  nand_exporter_t* exporter = nullptr;
  ORUStatsContext context;
  if (!GatherNANDStats(exporter, context)) {
    return {{"com.quill.NANDInfo.Error", "1"},
            {std::string(kNANDInfoErrorMessageKey), "Unable to parse buffer"}};
  }
  PropertyDict info = CreateNANDInfoDict(context, false);
  const PropertyDict purgeable = getReclaimerInfo();
  copyIfPresent(purgeable, "HLT_Reclaimer_totalPurgeable", info,
                "com.quill.NANDInfo.Reclaimer.TotalPurgeableBytes");
  copyIfPresent(purgeable, "HLT_Reclaimer_totalNonPurgeable", info,
                "com.quill.NANDInfo.Reclaimer.TotalNonPurgeableBytes");
  exporter->releaseStats(context);
  return info;
}

std::optional<PropertyDict> CopyNANDInfoWithOptions(const PropertyDict& /*options*/) {
  if (NandInfoShouldLogAllToEH()) {
    return PropertyDict();
  }
  logMessage(LogLevel::Default, "NANDInfo: CopyNANDInfoWithOptions: obtaining FTL data for TLYD\n");
  std::optional<PropertyDict> info = CopyNANDInfo();
  if (info->empty()) {
    SetAPIErrorMessage("CopyNANDInfoWithOptions: Unable to get FTL Fields for TLYD");
    logMessage(LogLevel::Default,
               "NANDInfo: CopyNANDInfoWithOptions: Unable to get FTL Fields for TLYD\n");
    info.reset();
  }
  logMessage(LogLevel::Default, "NANDInfo: CopyNANDInfoWithOptions: returning TLYD dictionary\n");
  return info;
}

void DumpNANDInfo(PropertyDict& info) {
  nand_exporter_t* exporter = nullptr;
  ORUStatsContext context;
  if (GatherNANDStats(exporter, context)) {
    for (const auto& [key, value] : CreateNANDInfoDict(context, true)) {
      CopyDictionary(key, value, info);
    }
    exporter->releaseStats(context);
  }
}

std::optional<PropertyDict> CopyNANDFTLInfo(bool useStatKeyParser, std::uint32_t enabled) {
  if (enabled == 0) {
    return std::nullopt;
  }
  std::optional<PropertyDict> fields = gatherORUFTLData(useStatKeyParser, true, 0);
  if (!fields || fields->empty()) {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas");
  }
  if (fields) {
    fields->set(kAPIErrorMessageKey, GetAPIErrorMessage());
  }
  return fields;
}

}  // namespace vesprun
