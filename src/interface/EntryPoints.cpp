#include "interface/EntryPoints.h"

#include <algorithm>
#include <limits>
#include <vector>

#include "NANDInfo/structuredlog/StructuredLog.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"
#include "telemetry/DiskInfo.h"
#include "telemetry/NVRAMStatistics.h"
#include "vesprun/vesprun.hpp"

namespace vesprun {
namespace {

using Values = std::span<const std::uint64_t>;
using Answer = std::optional<PropertyValue>;

constexpr std::uint64_t kMax32 = std::numeric_limits<std::uint32_t>::max();
constexpr std::uint64_t kMax64 = std::numeric_limits<std::uint64_t>::max();

constexpr EntryPointParameter kStatKeys[] = {{"stat-keys", "Names the fields by their ids"}};
constexpr EntryPointParameter kRound[] = {
    {"round", "Rounds the numbers to their significant digits"}};
constexpr EntryPointParameter kMagazine[] = {
    {"hours", "How long ago the snapshot was taken", kMax64, 0, true},
    {"raw", "The counters as the snapshot has them, not what they grew by"},
    {"mode", "0: counters that accumulate, 1: instantaneous values, 2: both", kMax32, 2}};
constexpr EntryPointParameter kEvents[] = {{"from-step", "The step to begin with, 0 to 6", kMax32},
                                           {"no-monthly", "Leaves out the step of a month"}};
constexpr EntryPointParameter kStructuredLog[] = {
    {"flag", "Passes the caller's flag on to the controller"},
    {"force", "Collects the validity list in any case"}};

Answer answer(bool value) { return PropertyValue(value); }
Answer answer(std::optional<PropertyDict> dict) {
  return dict ? Answer(*std::move(dict)) : std::nullopt;
}

template <auto function>
Answer call(Values /*values*/) {
  return answer(function());
}
template <auto function>
Answer callWithFlag(Values values) {
  return answer(function(values[0] != 0));
}

PropertyDict dumpedInfo() {
  PropertyDict info;
  DumpNANDInfo(info);
  return info;
}

/// True when the controller could be opened; it is closed again.
bool connectsToController() {
  ORUConnection connection;
  const bool opened = openORUConnection(connection);
  closeORUConnection(connection);
  return opened;
}

std::uint32_t low32(std::uint64_t value) { return static_cast<std::uint32_t>(value); }

constexpr EntryPointRow kEntryPoints[] = {
    {"info", "CopyNANDInfo", "The legacy NAND info", call<CopyNANDInfo>},
    {"info-for-daily-log", "CopyNANDInfoWithOptions",
     "The legacy NAND info, on the days when the daily log has it",
     [](Values) { return answer(CopyNANDInfoWithOptions({})); }},
    {"dump", "DumpNANDInfo", "The legacy NAND info without its version fields", call<dumpedInfo>},
    {"ftl-raw", "CopyNANDFTLInfo", "The FTL fields, all of them",
     [](Values values) { return answer(CopyNANDFTLInfo(values[0] != 0, 1)); }, kStatKeys},
    {"ftl", "CopyWhitelistedNANDFTLInfo", "The FTL fields that may leave the device",
     callWithFlag<CopyWhitelistedNANDFTLInfo>, kRound},
    {"msp", "CopyWhitelistedNANDMSPInfo", "The fields of each MSP that may leave the device",
     callWithFlag<CopyWhitelistedNANDMSPInfo>, kRound},
    {"storage-stats", "CopyWhitelistedStorageStats",
     "The storage statistics that may leave the device", callWithFlag<CopyWhitelistedStorageStats>,
     kRound},
    {"vm-freezer", "CopyVMFreezerNANDInfo", "What the kernel's swap-out thread has written",
     call<CopyVMFreezerNANDInfo>},
    {"magazine", "CopySMagNANDFTLInfo", "What happened since a snapshot of the stats magazine",
     [](Values values) {
       return answer(CopySMagNANDFTLInfo(values[0], values[1] != 0 ? 0 : 1, low32(values[2])));
     },
     kMagazine},
    {"magazine-history", "CopySMagNANDFTLCustomHistoryInfo",
     "The write amplification of the last six periods of four hours",
     [](Values) { return answer(CopySMagNANDFTLCustomHistoryInfo(0)); }},
    {"tendmark", "CopyTendmarkNANDInfo", "The storage's health, for service plans",
     call<CopyTendmarkNANDInfo>},
    {"ota", "CopyOTANANDInfo", "The storage's health, for updates over the air",
     call<CopyOTANANDInfo>},
    {"lab", "CopyInternalLabNANDInfo", "The storage's health, for labs",
     call<CopyInternalLabNANDInfo>},
    {"recommends-deletion", "NandRecommendsContentDeletion",
     "Does the controller recommend deleting content?", call<NandRecommendsContentDeletion>},
    {"events", "NandInfoExtractToEH_runAllSteps",
     "Sends the storage statistics as analytics events, and shows what was sent",
     [](Values values) {
       return answer(NandInfoExtractToEH_runAllSteps(0, values[1] == 0, 1, low32(values[0])));
     },
     kEvents},
    {"structured-log", "DumpStorageStructuredLog",
     "Logs the controller's lists: true when all could be handled",
     [](Values values) {
       if (values[1] != 0) {  // else it stays as a program has set it
         SetForceCollection(true);
       }
       return answer(DumpStorageStructuredLog(values[0] != 0));
     },
     kStructuredLog},
    {"disk", "GetDiskInfo", "Size and fullness of the user data volume", call<GetDiskInfo>},
    {"nvram", "gatherNVRAMStats", "The usage and write counters of the NVRAM",
     call<gatherNVRAMStats>},
    {"connect", "openORUConnection",
     "Opens the controller and closes it: true when it could be opened",
     call<connectsToController>},
};

/// The value of an argument as JSON has it; nothing when it is not of the parameter's kind.
std::optional<std::uint64_t> argumentValue(const EntryPointParameter& parameter,
                                           const PropertyValue& value) {
  if (parameter.isFlag()) {
    const bool* const flag = value.boolean();
    return flag != nullptr ? std::optional<std::uint64_t>(*flag) : std::nullopt;
  }
  const Number* const number = value.number();
  if (number == nullptr || number->isFloatingPoint() ||
      (number->isSigned() && number->asInt64() < 0) || number->asUInt64() > parameter.most) {
    return std::nullopt;
  }
  return number->asUInt64();
}

}  // namespace

std::span<const EntryPointRow> entryPoints() { return kEntryPoints; }

Json callToJson(const EntryPointRow& entryPoint, std::span<const std::uint64_t> values) {
  Json result = jsonOrNull(entryPoint.call(values));
  return {{"result", std::move(result)}, {"error", GetAPIErrorMessage()}};
}

std::optional<std::string> callByName(std::string_view name, std::string_view arguments,
                                      std::string& error) {
  const auto* const row = std::ranges::find_if(kEntryPoints, [name](const EntryPointRow& each) {
    return name == each.command || name == each.function;
  });
  if (row == std::end(kEntryPoints)) {
    error = "there is no entry point " + quotedText(name);
    return std::nullopt;
  }
  const std::string place = row->command + std::string(": ");
  std::vector<std::optional<std::uint64_t>> given(row->parameters.size());
  if (!arguments.empty()) {
    const std::optional<PropertyValue> value = valueFromJsonText(arguments, error);
    if (!value || value->dict() == nullptr) {
      error = place + "the arguments are no JSON object" + (value ? "" : ": " + error);
      return std::nullopt;
    }
    for (const auto& [key, argument] : *value->dict()) {
      const auto parameter =
          std::ranges::find(row->parameters, std::string_view(key), &EntryPointParameter::name);
      if (parameter == row->parameters.end()) {
        error = place + "there is no argument " + quotedText(key);
        return std::nullopt;
      }
      auto& taken = given[static_cast<std::size_t>(parameter - row->parameters.begin())];
      taken = argumentValue(*parameter, argument);
      if (!taken) {
        error =
            place + key +
            (parameter->isFlag() ? " is neither true nor false"
                                 : " is no number from 0 to " + std::to_string(parameter->most));
        return std::nullopt;
      }
    }
  }
  std::vector<std::uint64_t> values;
  for (std::size_t i = 0; i < given.size(); ++i) {
    if (!given[i] && row->parameters[i].isNeeded) {
      error = place + row->parameters[i].name + " is missing";
      return std::nullopt;
    }
    values.push_back(given[i].value_or(row->parameters[i].absent));
  }
  return jsonText(callToJson(*row, values));
}

}  // namespace vesprun
