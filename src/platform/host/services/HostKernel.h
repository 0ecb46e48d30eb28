#pragma once

#include "platform/Kernel.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/device/ECCEventQueue.h"

namespace vesprun {

/// The described kernel variables and figures, or those of Linux.
class HostKernel : public Kernel {
 public:
  HostKernel(const DeviceDescription& description, const DeviceDirectory& directory, SystemLog& log)
      : _description(description), _directory(directory), _log(log), _eccEvents(directory, log) {}

  int sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                   std::size_t& length) override;
  bool acknowledgeECCEvent() override { return _eccEvents.removeTaken(); }
  std::uint64_t pageSize() override;
  std::uint64_t monotonicTicks() override;
  std::optional<TickRatio> tickRatio() override;
  /// The described snapshot, whatever the flags; Linux has none. A file that cannot be read leaves
  /// an error in the system log.
  std::optional<Bytes> captureSnapshot(std::uint32_t captureFlags) override;

 private:
  std::optional<KernelVariable> variable(const std::string& name) const;

  const DeviceDescription& _description;
  const DeviceDirectory& _directory;
  SystemLog& _log;
  ECCEventQueue _eccEvents;
};

}  // namespace vesprun
