#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>

#include "platform/DeviceRegistry.h"

namespace vesprun {

class GenericParserCxt;
struct ORUStatsContext;

/// The opcodes that ask for an answer's size and fetch it.
struct TunnelSelector {
  std::uint32_t sizeOpcode;
  std::uint32_t dataOpcode;
};

inline constexpr TunnelSelector statsSelector{13, 13};
inline constexpr TunnelSelector readStatsSelector{10, 10};
inline constexpr TunnelSelector mspStatsSelector{221, 221};
inline constexpr TunnelSelector defectsListSelector{15, 15};
inline constexpr TunnelSelector telemetryListSelectors{17, 17};
inline constexpr TunnelSelector taskSchedulerSelectors{39, 39};
inline constexpr TunnelSelector snapshotSelectors{22, 22};
inline constexpr TunnelSelector snapshotHeaderSelectors{145, 145};
inline constexpr TunnelSelector bandStatsSelector{11, 11};

/// A class of storage controller and how to talk to it. Getters and parsers that it does not offer
/// are null. Only `connection` and `service` change at run time.
struct nand_exporter_t {
  using SelectorGetter = const TunnelSelector* (*)();
  /// Fills a context from a buffer, never reading outside. False or 0 is failure.
  using StatsParser = bool (*)(ORUStatsContext&, std::span<const std::uint8_t>);
  using FieldParser = std::uint32_t (*)(GenericParserCxt&, std::span<const std::uint8_t>);

  const char* name;                     ///< registry class of the driver
  const char* propertyKey;              ///< registry property of the characteristics
  RegistryHandle connection;            ///< user client, see `findNandExporterNew`
  RegistryHandle service;               ///< its service, see `findNandExporterNew`
  std::uint32_t contentDeletionMethod;  ///< or `kMethodNotOffered`
  std::uint32_t tunnelSizeMethod;
  std::uint32_t tunnelDataMethod;
  SelectorGetter getStatsSelectors;          ///< base statistics
  SelectorGetter getReadStatsSelectors;      ///< FTL statistics of a stats-magazine snapshot
  SelectorGetter getMspStatsSelectors;       ///< statistics of one MSP
  SelectorGetter getDefectsListSelectors;    ///< factory defects
  SelectorGetter getTelemetryListSelectors;  ///< telemetry lists
  SelectorGetter getTaskSchedulerSelectors;
  SelectorGetter getSnapshotSelectors;
  SelectorGetter getSnapshotHeaderSelectors;
  SelectorGetter getBandStatsSelectors;  ///< band validity
  StatsParser parseStats;
  void (*releaseStats)(ORUStatsContext&);
  FieldParser parseMSP;
  FieldParser parseFTL;
  FieldParser parseFTLStatKey;
  void (*releaseGenericCxt)(GenericParserCxt&);
};

inline constexpr std::uint32_t kMethodNotOffered = 0xFFFFFFFF;

/// The known controllers in search order, then an ending entry of zeros. One table for the process,
/// without a lock: look-ups must not overlap.
extern std::array<nand_exporter_t, 4> nand_exporters_tunnel;

/// The first object of the registry, matchable or not, that conforms to the class; 0 if none does.
/// The caller releases it.
RegistryHandle FindServiceUsingIterator(const std::string& className);

/// The service of the first known controller, matched by class or else found by walking the
/// registry; the caller releases it. `exporter` becomes its table entry. 0 and the ending entry
/// without a controller. Opens nothing.
RegistryHandle findNandExporter(nand_exporter_t*& exporter);

/// Opens the first known controller that can be matched and opened. True: `exporter` holds the
/// connection and the service, until `ReleaseIOInterfaces`. False: `exporter` is the ending entry,
/// without handles.
bool findNandExporterNew(nand_exporter_t*& exporter);

/// Closes the connection and releases the service, if there are any, and sets both to 0.
void ReleaseIOInterfaces(nand_exporter_t& exporter);

/// The same for other handles.
void closeAndForget(RegistryHandle& connection, RegistryHandle& service);

}  // namespace vesprun
