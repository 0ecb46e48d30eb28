#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>

#include "platform/DeviceRegistry.h"

namespace vesprun {

class GenericParserCxt;
struct ORUStatsContext;

/// The tunnel opcodes of one command: the one sent to ask for the size of the answer, and the one
/// sent to fetch it.
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

/// One class of storage controller and the way to talk to it. A getter or parser that a controller
/// does not offer is null. Only `connection` and `service` change at run time.
struct nand_exporter_t {
  using SelectorGetter = const TunnelSelector* (*)();
  /// Fills a context from a buffer, outside of which it never reads. False or 0 is failure.
  using StatsParser = bool (*)(ORUStatsContext&, std::span<const std::uint8_t>);
  using FieldParser = std::uint32_t (*)(GenericParserCxt&, std::span<const std::uint8_t>);

  const char* name;                     ///< registry class of the driver
  const char* propertyKey;              ///< registry property with the controller's characteristics
  RegistryHandle connection;            ///< user client, see `findNandExporterNew`
  RegistryHandle service;               ///< its service, see `findNandExporterNew`
  std::uint32_t contentDeletionMethod;  ///< `kMethodNotOffered` when there is none
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

/// The known controllers in the order in which they are looked for, then an ending entry with
/// every field 0. One table for the process, without a lock: look-ups must not overlap.
extern std::array<nand_exporter_t, 4> nand_exporters_tunnel;

/// The first object of the registry, hidden from matching or not, that conforms to the class. The
/// caller releases it. 0: none.
RegistryHandle FindServiceUsingIterator(const std::string& className);

/// The service of the first known controller that is present, matched by class or, when no class
/// matches, found by walking the registry. `exporter` becomes its table entry. 0 when there is
/// none; `exporter` is then the ending entry. Opens nothing; the caller releases the service.
RegistryHandle findNandExporter(nand_exporter_t*& exporter);

/// Opens the first known controller that can be matched and opened. True: the entry `exporter`
/// holds the connection and the service, for the caller to give back with `ReleaseIOInterfaces`.
/// False: none, and `exporter` is the ending entry without handles.
bool findNandExporterNew(nand_exporter_t*& exporter);

/// Closes the entry's connection and releases its service, if any, and forgets them.
void ReleaseIOInterfaces(nand_exporter_t& exporter);

/// The same for handles that lie elsewhere.
void closeAndForget(RegistryHandle& connection, RegistryHandle& service);

}  // namespace vesprun
