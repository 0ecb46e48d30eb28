#include "platform/host/services/HostKernel.h"

#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <bit>
#include <cerrno>
#include <cstring>

#include "platform/host/device/LiveSystem.h"
#include "platform/host/files/WholeFile.h"

namespace vesprun {
namespace {

static_assert(std::endian::native == std::endian::little, "kernel variables are little-endian");

Bytes bytesOf(const KernelVariable& variable) {
  return std::visit(
      [](const auto& content) -> Bytes {
        using Content = std::decay_t<decltype(content)>;
        if constexpr (std::is_same_v<Content, Bytes>) {
          return content;
        } else if constexpr (std::is_same_v<Content, std::string>) {
          Bytes bytes(content.begin(), content.end());
          bytes.push_back(0);
          return bytes;
        } else {
          Bytes bytes(sizeof content);
          std::memcpy(bytes.data(), &content, sizeof content);
          return bytes;
        }
      },
      variable);
}

}  // namespace

int HostKernel::sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                             std::size_t& length) {
  if (name == "kern.next_ecc_event") {
    const int described = _description.eccError.value_or(0);
    return described != 0 ? described : _eccEvents.takeNext(buffer, length);
  }
  const std::optional<KernelVariable> content = variable(name);
  if (!content) {
    return ENOENT;
  }
  const Bytes bytes = bytesOf(*content);
  const bool isText = std::holds_alternative<std::string>(*content);
  if (isText ? bytes.size() > buffer.size() : bytes.size() != buffer.size()) {
    return isText ? ENOMEM : EINVAL;
  }
  std::copy(bytes.begin(), bytes.end(), buffer.begin());
  length = bytes.size();
  return 0;
}

std::optional<KernelVariable> HostKernel::variable(const std::string& name) const {
  if (const auto described = _description.variables.find(name);
      described != _description.variables.end()) {
    return described->second;
  }
  if (name == "kern.bootsessionuuid") {
    return live::bootSessionIdentifier();
  }
  if (name == "vm.swapusage") {
    return live::swapUsage();
  }
  return std::nullopt;
}

std::uint64_t HostKernel::pageSize() {
  return _description.pageSize ? *_description.pageSize
                               : static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE));
}

std::uint64_t HostKernel::monotonicTicks() {
  if (_description.ticks.value) {
    return _description.ticks.value->value;
  }
  timespec time{};
  clock_gettime(CLOCK_MONOTONIC, &time);  // stops while the machine is suspended
  return static_cast<std::uint64_t>(time.tv_sec) * 1'000'000'000 +
         static_cast<std::uint64_t>(time.tv_nsec);
}

std::optional<TickRatio> HostKernel::tickRatio() {
  if (_description.ticks.isNull) {
    return std::nullopt;
  }
  return _description.ticks.value ? _description.ticks.value->ratio : TickRatio{1, 1};
}

std::optional<Bytes> HostKernel::captureSnapshot(std::uint32_t /*captureFlags*/) {
  if (!_description.snapshotFile) {
    return std::nullopt;
  }
  std::string error;
  const std::optional<std::string> content =
      readWholeFile(_directory.hostPath(*_description.snapshotFile), error);
  if (!content) {
    _log.write(LogLevel::Error, "Kernel snapshot: " + error);
    return std::nullopt;
  }
  return Bytes(content->begin(), content->end());
}

}  // namespace vesprun
