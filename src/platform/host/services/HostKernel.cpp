#include "platform/host/services/HostKernel.h"

#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "platform/host/device/LiveSystem.h"
#include "platform/host/files/Files.h"

namespace vesprun {
int HostKernel::sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                             std::size_t& length) {
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

std::optional<KernelVariable> HostKernel::variable(const std::string& name) const {
  const auto& described = _description.kernel.variables;
  if (const auto found = described.find(name); found != described.end()) {
    return found->second;
  }
  if (name == "kern.bootsessionuuid") {
    return live::bootSessionIdentifier();
  }
  return name == "vm.swapusage" ? live::swapUsage() : std::nullopt;
}

std::uint64_t HostKernel::pageSize() {
  return describedOr(_description.kernel.pageSize,
                     [] { return static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE)); });
}

std::uint64_t HostKernel::monotonicTicks() {
  if (const auto& ticks = _description.kernel.ticks; ticks && *ticks) {
    return (*ticks)->value;
  }
  timespec time{};
  clock_gettime(CLOCK_MONOTONIC, &time);  // stops while the machine is suspended
  return static_cast<std::uint64_t>(time.tv_sec) * 1'000'000'000 +
         static_cast<std::uint64_t>(time.tv_nsec);
}

std::optional<TickRatio> HostKernel::tickRatio() {
  const auto& ticks = _description.kernel.ticks;
  if (!ticks) {
    return TickRatio{1, 1};
  }
  return *ticks ? std::optional((*ticks)->ratio) : std::nullopt;
}

std::optional<Bytes> HostKernel::captureSnapshot(std::uint32_t /*captureFlags*/) {
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

}  // namespace vesprun
