#pragma once

#include <cstdint>
#include <span>
#include <string>

#include "platform/DeviceRegistry.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// Is the entry of the class, or of one that conforms to it?
bool conformsTo(const RegistryEntryDescription& entry, std::string_view className);

/// The driver behind one user-client connection. It answers at the wire: the same requests, the
/// same checks and the same bytes as a driver of the entry's class, with the answers that the entry
/// describes.
class SimulatedDriver {
 public:
  /// What a driver answers to a call that it does not understand.
  static constexpr RegistryResult kBadArgument = 0xE00002C2;
  /// What it answers to a four-character code that it does not know.
  static constexpr RegistryResult kError = 0xE00002BC;

  /// `entry` has a user client.
  SimulatedDriver(const RegistryEntryDescription& entry, const DeviceDirectory& directory,
                  SystemLog& log)
      : _entry(entry), _directory(directory), _log(log) {}

  /// A tunnel command or the content-deletion query, by the method numbers of the entry's class. An
  /// answer's file that cannot be read fails the call like a command without an answer; the system
  /// log names the file.
  RegistryResult callStructMethod(std::uint32_t method, std::span<const std::uint8_t> input,
                                  std::span<std::uint8_t> output, std::uint64_t& outputLength);

  RegistryResult callScalarMethod(std::uint32_t method, std::uint64_t input, std::uint64_t& output);

  RegistryResult closeError() const { return _entry.userClient->closeError; }

 private:
  RegistryResult tunnel(std::span<const std::uint8_t> input, std::span<std::uint8_t> output,
                        std::uint64_t& outputLength);
  RegistryResult contentDeletion(std::span<const std::uint8_t> input,
                                 std::span<std::uint8_t> output, std::uint64_t& outputLength);

  const RegistryEntryDescription& _entry;
  const DeviceDirectory& _directory;
  SystemLog& _log;
};

}  // namespace vesprun
