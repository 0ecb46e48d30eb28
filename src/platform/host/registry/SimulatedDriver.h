#pragma once

#include <cstdint>
#include <span>

#include "platform/DeviceRegistry.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// Is the entry of the class, or does it conform to it?
bool conformsTo(const RegistryEntryDescription& entry, std::string_view className);

/// The driver behind one user-client connection. It answers at the wire as a driver of the entry's
/// class would: the same requests, checks and bytes, with the described answers.
class SimulatedDriver {
 public:
  /// The answer to a call that the driver does not understand.
  static constexpr RegistryResult kBadArgument = 0xE00002C2;
  /// The answer to an unknown four-character code.
  static constexpr RegistryResult kError = 0xE00002BC;

  /// `entry` has a user client.
  SimulatedDriver(const RegistryEntryDescription& entry, const DeviceDirectory& directory,
                  SystemLog& log)
      : _entry(entry), _directory(directory), _log(log) {}

  /// A tunnel command or the content-deletion query, by the method numbers of the entry's class. An
  /// answer's file that cannot be read fails the call, with an error in the system log.
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
