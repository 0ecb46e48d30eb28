#include "driver/DailyStorageAndDeviceStats.h"

#include <optional>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/sets/LegacyNANDInfo.h"
#include "NANDInfo/sets/VMFreezerInfo.h"
#include "NANDInfo/structuredlog/StructuredLog.h"
#include "common/TextForm.h"
#include "platform/Guarded.h"
#include "platform/Platform.h"
#include "telemetry/DataUsage.h"
#include "telemetry/DiskInfo.h"
#include "telemetry/KernelECCEvents.h"
#include "telemetry/ReportingChannels.h"

namespace vesprun {
namespace {

void logDiskUsage() {
  const std::optional<PropertyValue> answer =
      platform().deviceInformation().OrreryCopyAnswer("DiskUsage");
  Tallybook& tallybook = platform().tallybook();
  tallybook.TBClientSetValueForScalarKey(
      "com.quill.homeshell.DiskUsageUserTotalBlocks",
      diskUsageInMebibytes(answer, kDiskUsageTotalDiskCapacity).value_or(-1));
  tallybook.TBClientSetValueForScalarKey(
      "com.quill.homeshell.DiskUsageUserBlocksFree",
      diskUsageInMebibytes(answer, kDiskUsageTotalDataAvailable).value_or(-1));
}

void logNANDInfo() {
  std::optional<PropertyDict> info = gatherNANDInfoForDailyLog();
  if (!info) {
    logMessage(LogLevel::Default, "failed to get NAND info dict");
    return;
  }
  info->merge(gatherVMFreezerInfo());
  SetNANDInfoScalars(*info);
}

}  // namespace

void SetNANDInfoScalars(const PropertyDict& info) {
  if (const PropertyValue* error = info.find(kNANDInfoErrorKey)) {
    const PropertyValue* message = info.find(kNANDInfoErrorMessageKey);
    logMessage(LogLevel::Default, "error reading nand info, error %s with message %s",
               textForm(*error).c_str(),
               message != nullptr ? textForm(*message).c_str() : "(null)");
    return;
  }
  Tallybook& tallybook = platform().tallybook();
  for (const auto& [key, value] : info) {
    if (const Number* number = value.number()) {
      tallybook.TBClientSetValueForScalarKey(key, number->asInt64());
    } else if (const bool* boolean = value.boolean()) {
      tallybook.TBClientSetValueForScalarKey(key, *boolean ? 1 : 0);
    }
  }
}

void LogDailyStorageAndDeviceStats() {
  runGuarded(logDiskUsage);
  runGuarded([] { DumpStorageStructuredLog(false); });
  runGuarded(logNANDInfo);
  runGuarded(LogKernelECCEvents);
  runGuarded([] { CollectDataUsage(); });
  runGuarded(LogTaplineChannelScalars);
}

}  // namespace vesprun
