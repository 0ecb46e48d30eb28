#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/controller/NandExporter.h"
#include "NANDInfo/controller/TunnelCommand.h"
#include "platform/DeviceRegistry.h"

namespace vesprun {

/// Asks one controller for the lists of the structured storage log. A request is a tunnel request
/// whose size query is a word of flags: bit 0 is set when the size is asked for, bit 1 is the
/// caller's flag, bits 2 to 9 are the kind of the list.
class ControllerListReader {
 public:
  /// All must outlive the reader; it closes nothing.
  ControllerListReader(DeviceRegistry& registry, RegistryHandle connection,
                       const nand_exporter_t& exporter, bool callersFlag)
      : _registry(registry),
        _connection(connection),
        _exporter(exporter),
        _callersFlag(callersFlag) {}

  /// The list of a kind, 0 to 255, in a buffer of the size that the controller stated first; what
  /// it did not deliver of it is zero. `index`, the list's place in the log, is for the error text
  /// alone. Without memory when there is no list, which is told on the standard error stream unless
  /// the list is empty.
  TunnelBuffer read(const TunnelSelector& selector, std::uint32_t kind, int index) const;

 private:
  TunnelBuffer readData(std::uint32_t opcode, std::uint32_t flags, std::uint32_t size) const;
  RegistryResult call(std::uint32_t method, std::uint32_t opcode, std::uint32_t flags,
                      std::span<std::uint8_t> output) const;

  DeviceRegistry& _registry;
  RegistryHandle _connection;
  const nand_exporter_t& _exporter;
  bool _callersFlag;
};

}  // namespace vesprun
