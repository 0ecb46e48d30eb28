#include "NANDInfo/lists/StructuredLog.h"

#include <array>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <new>
#include <optional>
#include <span>
#include <string_view>
#include <vector>

#include "NANDInfo/controller/ControllerConnection.h"
#include "NANDInfo/controller/ControllerListReader.h"
#include "NANDInfo/controller/NandExporter.h"
#include "NANDInfo/lists/FactoryDefectList.h"
#include "NANDInfo/lists/StructuredLogState.h"
#include "NANDInfo/lists/TelemetryList.h"
#include "NANDInfo/lists/WriteAmplification.h"
#include "NANDInfo/sets/NANDInfo.h"
#include "platform/Platform.h"
#include "platform/RegistryObject.h"
#include "telemetry/NANDLogWriter.h"

namespace vesprun {
namespace {

/// Takes a list as the controller gave it, the controller's properties and its class name. False
/// when the list could not be handled.
using ListHandler = bool (*)(std::span<const std::uint8_t>, const PropertyValue*, std::string_view);

/// A type of list, of which a controller may have several kinds.
struct ListType {
  nand_exporter_t::SelectorGetter nand_exporter_t::*getter;
  ListHandler handler;
  std::uint32_t kindCount;
  const char* whenNotOffered;
};

constexpr std::array<ListType, 3> kListTypes{{
    {&nand_exporter_t::getBandStatsSelectors, WriteValidityListNANDLog, 1,
     "Validity list retrieval is not supported\n"},
    {&nand_exporter_t::getTelemetryListSelectors, LogNANDTelemetryList, 3,
     "Telemetry list retrieval is not supported\n"},
    {&nand_exporter_t::getDefectsListSelectors, LogFactoryDefectList, 1,
     "Defects list retrieval is not supported\n"},
}};

/// One list to fetch.
struct HandlerEntry {
  nand_exporter_t::SelectorGetter getter;
  ListHandler handler;
  std::uint32_t kind;
};

std::vector<HandlerEntry> handlerList(const nand_exporter_t& exporter) {
  std::vector<HandlerEntry> entries;
  for (const ListType& type : kListTypes) {
    const nand_exporter_t::SelectorGetter getter = exporter.*type.getter;
    if (getter == nullptr) {
      std::fputs(type.whenNotOffered, stderr);
      continue;
    }
    for (std::uint32_t kind = 0; kind < type.kindCount; ++kind) {
      entries.push_back({getter, type.handler, kind});
    }
  }
  return entries;
}

void decideOnValidityList() {
  gCurrentUserWamp = 0.0;
  gCurrentSysWamp = 0.0;
  const bool forced = gForceCollectionSet != 0;
  const std::unique_ptr<ORUStatsContext> statistics(new (std::nothrow) ORUStatsContext());
  if (!statistics) {
    std::fputs("not enough memory?", stderr);
    gNeedValidityList = forced;
    return;
  }
  WriteAmplification amplification;
  nand_exporter_t* exporter = nullptr;
  if (GatherNANDStats(exporter, *statistics)) {
    amplification = writeAmplification(*statistics);
    exporter->releaseStats(*statistics);
  }
  gCurrentUserWamp = static_cast<double>(amplification.user);
  gCurrentSysWamp = static_cast<double>(amplification.intermediate);
  gNeedValidityList = isAboveWriteAmplificationThreshold(amplification.user) || forced;
}

bool logLists(const nand_exporter_t& exporter, RegistryHandle connection,
              const PropertyValue& properties, bool callersFlag) {
  const ControllerListReader reader(platform().deviceRegistry(), connection, exporter, callersFlag);
  bool result = true;
  int index = 0;
  for (const HandlerEntry& entry : handlerList(exporter)) {
    const TunnelSelector* selector = entry.getter();
    if (selector == nullptr) {
      result = false;
    } else if (const TunnelBuffer list = reader.read(*selector, entry.kind, index)) {
      result = entry.handler(list.bytes(list.size()), &properties, exporter.name) && result;
    }
    ++index;
  }
  return result;
}

}  // namespace

bool DumpStorageStructuredLog(bool callersFlag) {
  decideOnValidityList();
  nand_exporter_t* exporter = nullptr;
  const RegistryObject service(findNandExporter(exporter));
  if (!service) {
    std::fputs("Could not get matching DevRegKit service for exporting classes\n", stderr);
    return false;
  }
  const ControllerConnection connection(service.get());
  if (!connection) {
    std::fputs("Could not get connection to service\n", stderr);
    return false;
  }
  const std::optional<PropertyValue> properties =
      platform().deviceRegistry().DevRegRegistryEntrySearchProperty(
          service.get(), exporter->propertyKey, DeviceRegistry::SearchDirection::Parents);
  if (!properties) {
    std::fputs("failed to create dictionary", stderr);
    return false;
  }
  return logLists(*exporter, connection.get(), *properties, callersFlag);
}

}  // namespace vesprun
