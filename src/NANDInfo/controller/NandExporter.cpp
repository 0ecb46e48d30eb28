#include "NANDInfo/controller/NandExporter.h"

#include <cstdio>
#include <utility>

#include "NANDInfo/parsers/GenericParserCxt.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "common/ProcessState.h"
#include "platform/RegistryObject.h"

namespace vesprun {
namespace {

template <const TunnelSelector& selector>
const TunnelSelector* selectorGetter() {
  return &selector;
}

constexpr nand_exporter_t exporter(const char* name, const char* propertyKey,
                                   std::uint32_t contentDeletionMethod,
                                   std::uint32_t tunnelMethod) {
  return {.name = name,
          .propertyKey = propertyKey,
          .connection = 0,
          .service = 0,
          .contentDeletionMethod = contentDeletionMethod,
          .tunnelSizeMethod = tunnelMethod,
          .tunnelDataMethod = tunnelMethod,
          .getStatsSelectors = selectorGetter<statsSelector>,
          .getReadStatsSelectors = selectorGetter<readStatsSelector>,
          .getMspStatsSelectors = nullptr,
          .getDefectsListSelectors = selectorGetter<defectsListSelector>,
          .getTelemetryListSelectors = selectorGetter<telemetryListSelectors>,
          .getTaskSchedulerSelectors = selectorGetter<taskSchedulerSelectors>,
          .getSnapshotSelectors = selectorGetter<snapshotSelectors>,
          .getSnapshotHeaderSelectors = selectorGetter<snapshotHeaderSelectors>,
          .getBandStatsSelectors = selectorGetter<bandStatsSelector>,
          .parseStats = ORUParseBufferToCxt,
          .releaseStats = ORUReleaseContext,
          .parseMSP = nullptr,
          .parseFTL = ORUFTLParseBufferToCxt,
          .parseFTLStatKey = ORUFTLParseStatKeyBufferToCxt,
          .releaseGenericCxt = ReleaseGenericParserCxt};
}

constexpr nand_exporter_t withMSPStatistics(nand_exporter_t exporter) {
  exporter.getMspStatsSelectors = selectorGetter<mspStatsSelector>;
  exporter.parseMSP = ORUMSPParseBufferToCxt;
  return exporter;
}

}  // namespace

std::array<nand_exporter_t, 4> nand_exporters_tunnel{
    withMSPStatistics(
        exporter("QuillQNS3NVMeController", "Controller Characteristics", kMethodNotOffered, 9)),
    exporter("QuillEmbeddedNVMeController", "Controller Characteristics", kMethodNotOffered, 9),
    exporter("ORUStorage", "DevRegPropertyMatch", 5, 8),
    nand_exporter_t{},
};

namespace {

const ProcessState kHandleState([] {
  for (nand_exporter_t& entry : nand_exporters_tunnel) {
    entry.connection = 0;
    entry.service = 0;
  }
});

}  // namespace

RegistryHandle FindServiceUsingIterator(const std::string& className) {
  DeviceRegistry& registry = platform().deviceRegistry();
  const RegistryObject root(registry.DevRegRegistryGetRootEntry());
  if (!root) {
    return 0;
  }
  const RegistryObject iterator(registry.DevRegRegistryEntryCreateIterator(root.get()));
  if (!iterator) {
    return 0;
  }
  while (RegistryObject object{registry.DevRegIteratorNext(iterator.get())}) {
    if (registry.DevRegObjectConformsTo(object.get(), className)) {
      return object.take();
    }
  }
  return 0;
}

RegistryHandle findNandExporter(nand_exporter_t*& exporter) {
  for (exporter = nand_exporters_tunnel.data(); exporter->name != nullptr; ++exporter) {
    if (RegistryObject service{
            platform().deviceRegistry().DevRegServiceGetMatchingService(exporter->name)}) {
      logMessage(LogLevel::Notice, "NANDInfo: findNandExporter: Controller found: %s\n",
                 exporter->name);
      return service.take();
    }
  }
  std::fputs(
      "Failed to find matching service with DevRegServiceGetMatchingService, trying iterator...\n",
      stderr);
  for (exporter = nand_exporters_tunnel.data(); exporter->name != nullptr; ++exporter) {
    if (RegistryObject service{FindServiceUsingIterator(exporter->name)}) {
      logMessage(LogLevel::Notice, "Find service for class %s\n", exporter->name);
      return service.take();
    }
  }
  return 0;
}

bool findNandExporterNew(nand_exporter_t*& exporter) {
  DeviceRegistry& registry = platform().deviceRegistry();
  exporter = nullptr;
  nand_exporter_t* entry = nand_exporters_tunnel.data();
  for (; entry->name != nullptr; ++entry) {
    RegistryObject service(registry.DevRegServiceGetMatchingService(entry->name));
    if (!service) {
      continue;
    }
    RegistryHandle connection = 0;
    if (registry.DevRegServiceOpen(service.get(), connection) == kRegistrySuccess) {
      entry->connection = connection;
      entry->service = service.take();
      exporter = entry;
      logMessage(LogLevel::Notice, "NANDInfo: findNandExporterNew: Controller found: %s\n",
                 entry->name);
      return true;
    }
    registry.DevRegServiceClose(connection);
  }
  entry->connection = 0;
  entry->service = 0;
  exporter = entry;
  return false;
}

void ReleaseIOInterfaces(nand_exporter_t& exporter) {
  closeAndForget(exporter.connection, exporter.service);
}

void closeAndForget(RegistryHandle& connection, RegistryHandle& service) {
  DeviceRegistry& registry = platform().deviceRegistry();
  if (const RegistryHandle open = std::exchange(connection, 0)) {
    registry.DevRegServiceClose(open);
  }
  if (const RegistryHandle held = std::exchange(service, 0)) {
    registry.DevRegObjectRelease(held);
  }
}

}  // namespace vesprun
