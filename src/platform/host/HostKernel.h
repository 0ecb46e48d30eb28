#pragma once

#include "platform/Kernel.h"
#include "platform/host/DeviceDescription.h"

namespace vesprun {

/// The kernel variables and figures that the device description gives, and those of Linux where it
/// is silent.
class HostKernel : public Kernel {
 public:
  explicit HostKernel(const KernelDescription& description) : _description(description) {}

  int sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                   std::size_t& length) override;
  std::uint64_t pageSize() override;
  std::uint64_t monotonicTicks() override;
  std::optional<TickRatio> tickRatio() override;

 private:
  std::optional<KernelVariable> variable(const std::string& name) const;

  const KernelDescription& _description;
};

}  // namespace vesprun
