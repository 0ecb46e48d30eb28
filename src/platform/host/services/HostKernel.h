#pragma once

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>

#include "platform/Kernel.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/device/ECCEventQueue.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/Files.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {

/// The described kernel variables and figures, or those of Linux.
class HostKernel : public Kernel {
 public:
  HostKernel(const DeviceDescription& description, const DeviceDirectory& directory, SystemLog& log)
      : _description(description), _directory(directory), _log(log), _eccEvents(directory, log) {}

  int sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                   std::size_t& length) override {
    if (name == "kern.next_ecc_event") {
      const int described = _description.kernel.eccError.value_or(0);
      return described != 0 ? described : _eccEvents.takeNext(buffer, length);
    }
    const std::optional<KernelVariable> content = variable(name);
    if (!content) {
      return ENOENT;
    }
    const auto& [bytes, isText] = *content;
    if (isText ? bytes.size() > buffer.size() : bytes.size() != buffer.size()) {
      return isText ? ENOMEM : EINVAL;
    }
    std::ranges::copy(bytes, buffer.begin());
    length = bytes.size();
    return 0;
  }
  /// First makes its record durable: else both could be lost when the power fails.
  bool acknowledgeECCEvent() override {
    std::string error;
    const HostPath records = _directory.hostPath(kRecordsFile);
    if (!flushFile(records, error) && (records.status() || errno != ENOENT)) {
      _log.write(LogLevel::Error, error);
      return false;
    }
    return _eccEvents.removeTaken();
  }
  std::uint64_t pageSize() override {
    return describedOr(_description.kernel.pageSize,
                       [] { return static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE)); });
  }
  std::uint64_t monotonicTicks() override {
    if (const auto& ticks = _description.kernel.ticks; ticks && *ticks) {
      return (*ticks)->value;
    }
    // It stops while the machine is suspended.
    const auto running = std::chrono::steady_clock::now().time_since_epoch();
    return static_cast<std::uint64_t>(running / std::chrono::nanoseconds(1));
  }
  std::optional<TickRatio> tickRatio() override {
    const auto& ticks = _description.kernel.ticks;
    if (!ticks) {
      return TickRatio{1, 1};
    }
    return *ticks ? std::optional((*ticks)->ratio) : std::nullopt;
  }
  /// The described snapshot, whatever the flags; Linux has none. A file that cannot be read leaves
  /// an error in the system log.
  std::optional<Bytes> captureSnapshot(std::uint32_t /*captureFlags*/) override {
    if (!_description.kernel.snapshotFile) {
      return std::nullopt;
    }
    std::string error;
    const std::optional<std::string> content =
        readWholeFile(_directory.hostPath(*_description.kernel.snapshotFile), error);
    if (!content) {
      _log.write(LogLevel::Error, "Kernel snapshot: " + error);
      return std::nullopt;
    }
    return Bytes(content->begin(), content->end());
  }

 private:
  std::optional<KernelVariable> variable(const std::string& name) const {
    const auto& described = _description.kernel.variables;
    if (const auto found = described.find(name); found != described.end()) {
      return found->second;
    }
    if (name == "kern.bootsessionuuid") {
      return live::bootSessionIdentifier();
    }
    return name == "vm.swapusage" ? live::swapUsage() : std::nullopt;
  }

  const DeviceDescription& _description;
  const DeviceDirectory& _directory;
  SystemLog& _log;
  ECCEventQueue _eccEvents;
};

}  // namespace vesprun
