#include "platform/host/services/HostOrrery.h"

#include "platform/host/device/LiveSystem.h"

namespace vesprun {

std::optional<PropertyValue> HostOrrery::OrreryCopyAnswer(std::string_view question) {
  if (question == "InternalBuild") {
    return _description.internalBuild;
  }
  if (question == "DiskUsage") {
    return diskUsage();
  }
  if (question == "InverseDeviceID") {
    return _description.inverseDeviceID;
  }
  return std::nullopt;
}

std::optional<PropertyValue> HostOrrery::diskUsage() const {
  if (!_description.diskUsage.isLive()) {
    return _description.diskUsage.value;
  }
  const std::optional<FileSystemStatistics> volume = live::volume(_directory.path());
  if (!volume) {
    return std::nullopt;
  }
  const auto bytes = [&](std::uint64_t blocks) {
    return static_cast<std::int64_t>(blocks * volume->blockSize);
  };
  return PropertyDict{{std::string(kDiskUsageTotalDiskCapacity), bytes(volume->blocks)},
                      {std::string(kDiskUsageTotalDataAvailable), bytes(volume->availableBlocks)},
                      {std::string(kDiskUsageAmountDataAvailable), bytes(volume->availableBlocks)}};
}

}  // namespace vesprun
