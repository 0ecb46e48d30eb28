#include "NANDInfo/structuredlog/StructuredLog.h"

#include <array>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <new>
#include <optional>
#include <span>
#include <string_view>

#include "NANDInfo/controller/Controller.h"
#include "NANDInfo/controller/TunnelCommand.h"
#include "NANDInfo/sets/StatisticsGathering.h"
#include "NANDInfo/structuredlog/FactoryDefectList.h"
#include "NANDInfo/structuredlog/NANDLogWriter.h"
#include "NANDInfo/structuredlog/StructuredLogGlobals.h"
#include "NANDInfo/structuredlog/TelemetryList.h"
#include "NANDInfo/structuredlog/WriteAmplification.h"
#include "common/LittleEndian.h"

namespace vesprun {
namespace {

// A list request's size query is a word of flags, with the kind of the list in bits 2 to 9.
constexpr std::uint32_t kSizePhase = 1;
constexpr std::uint32_t kCallersFlag = 2;
constexpr unsigned kKindShift = 2;

/// Handles a list as the controller sent it, with the controller's properties and class name. False
/// on failure.
using ListHandler = bool (*)(std::span<const std::uint8_t>, const PropertyValue*, std::string_view);

/// A type of list; a controller may have several kinds.
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

/// A list in a buffer of the size stated first; undelivered bytes are zero. Empty on failure.
/// `index` is for the error text.
TunnelBuffer fetchList(const Controller& controller, const TunnelSelector& selector,
                       std::uint32_t flags, int index) {
  DeviceRegistry& registry = platform().deviceRegistry();
  const nand_exporter_t& exporter = controller.exporter();
  TunnelRequest request{.opcode = selector.sizeOpcode, .sizeQuery = flags | kSizePhase};
  std::array<std::uint8_t, 4> answer{};
  std::uint64_t reportedLength = 0;
  if (const RegistryResult error =
          registry.DevRegConnectCallStructMethod(controller.connection(), exporter.tunnelSizeMethod,
                                                 request.encode(), answer, reportedLength)) {
    std::fprintf(stderr,
                 "DevRegConnectCallStructMethod failed with status 0x%x on selector index %d\n",
                 error, index);
    return {};
  }
  const auto size = loadLittleEndian<std::uint32_t>(answer.data());
  if (size == 0) {
    return {};
  }
  // Page alignment is not needed: the driver copies.
  TunnelBuffer list(size);
  if (!list) {
    std::fprintf(stderr, "Could not malloc %zu bytes", std::size_t{size});
    return {};
  }
  request.opcode = selector.dataOpcode;
  request.sizeQuery = flags;
  if (registry.DevRegConnectCallStructMethod(controller.connection(), exporter.tunnelDataMethod,
                                             request.encode(), list.bytes(),
                                             reportedLength) != kRegistrySuccess) {
    std::fprintf(stderr, "Could not retrieve data from driver for selector %u\n",
                 selector.dataOpcode);
    return {};
  }
  return list;
}

}  // namespace

bool DumpStorageStructuredLog(bool callersFlag) {
  decideOnValidityList();
  Controller controller;
  if (!controller.open()) {
    return false;
  }
  const nand_exporter_t& exporter = controller.exporter();
  const std::optional<PropertyValue> properties =
      platform().deviceRegistry().DevRegRegistryEntrySearchProperty(
          controller.service(), exporter.propertyKey, DeviceRegistry::SearchDirection::Parents);
  if (!properties) {
    std::fputs("failed to create dictionary", stderr);
    return false;
  }
  for (const ListType& type : kListTypes) {
    if (exporter.*type.getter == nullptr) {
      std::fputs(type.whenNotOffered, stderr);
    }
  }
  bool result = true;
  int index = 0;
  for (const ListType& type : kListTypes) {
    const std::uint32_t kinds = exporter.*type.getter != nullptr ? type.kindCount : 0;
    for (std::uint32_t kind = 0; kind < kinds; ++kind, ++index) {
      const TunnelSelector* selector = (exporter.*type.getter)();
      const std::uint32_t flags = (callersFlag ? kCallersFlag : 0) | kind << kKindShift;
      if (selector == nullptr) {
        result = false;
      } else if (const TunnelBuffer list = fetchList(controller, *selector, flags, index)) {
        result = type.handler(list.bytes(list.size()), &*properties, exporter.name) && result;
      }
    }
  }
  return result;
}

}  // namespace vesprun
