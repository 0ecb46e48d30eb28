#include "telemetry/DiskInfo.h"

#include <bit>

#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr const char* kUserVolume = "/private/var";

/// Byte counts of a file system are computed modulo 2^64.
PropertyDict measureFileSystem() {
  std::uint64_t available = 0;
  std::uint64_t fullness = 0;
  std::uint64_t total = 0;
  std::uint64_t capacity = 0;
  if (const auto volume = platform().fileSystem().statfs(kUserVolume)) {
    total = volume->blocks * volume->blockSize;
    available = volume->availableBlocks * volume->blockSize;
    fullness = total != 0 ? (total - available) * 10'000 / total : 0;
    capacity = GetUserCapacityInGB(static_cast<std::uint32_t>(total / 1'000'000));
  }
  return {{"HLT_OR_AmountDataAvailable_MB", available >> 20},
          {"HLT_OR_Diskfullness_BP", fullness},
          {"HLT_OR_Capacity_GB", capacity},
          {"HLT_Capacity_GB", capacity},
          {"HLT_Diskfullness_BP", fullness},
          {"HLT_UserCapacity_MB", total >> 20}};
}

bool isPlausible(const PropertyDict& info) {
  return info.find("HLT_OR_Capacity_GB")->number()->asInt32() > 0 &&
         info.find("HLT_OR_Diskfullness_BP")->number()->asInt32() >= 1;
}

PropertyDict askForDiskUsage() {
  const std::optional<PropertyValue> answer =
      platform().deviceInformation().OrreryCopyAnswer("DiskUsage");
  const auto mebibytes = [&answer](std::string_view name) {
    return diskUsageInMebibytes(answer, name).value_or(0);
  };
  const std::int64_t total = mebibytes(kDiskUsageTotalDiskCapacity);
  const std::int64_t totalAvailable = mebibytes(kDiskUsageTotalDataAvailable);
  const std::int64_t available = mebibytes(kDiskUsageAmountDataAvailable);
  const std::uint32_t capacity = GetUserCapacityInGB(static_cast<std::uint32_t>(total));
  // Counts have 44 bits: the factor fits.
  const std::int64_t fullness = total >= 1 ? (total - totalAvailable) * 10'000 / total : 0;
  return {{"HLT_OR_Capacity_GB", capacity},
          {"HLT_Capacity_GB", capacity},
          {"HLT_UserCapacity_MB", total >= 1 ? total : std::int64_t{0}},
          {"HLT_OR_Diskfullness_BP", fullness},
          {"HLT_OR_AmountDataAvailable_MB", available},
          {"HLT_Diskfullness_BP", fullness}};
}

}  // namespace

std::uint32_t GetUserCapacityInGB(std::uint64_t userCapacityMB) {
  const auto capacity = static_cast<std::uint32_t>(userCapacityMB);
  constexpr std::uint32_t kFirst1536 = 0x150000;
  if (capacity >= kFirst1536 && capacity < kFirst1536 + 385 * 1024) {
    return 1536;
  }
  if (capacity == 0) {
    return 0;
  }
  return static_cast<std::uint32_t>((std::uint64_t{1} << std::bit_width(capacity)) / 1024);
}

PropertyDict GetDiskInfo() {
  PropertyDict measured = measureFileSystem();
  return isPlausible(measured) ? measured : askForDiskUsage();
}

std::optional<std::int64_t> diskUsageInMebibytes(const std::optional<PropertyValue>& answer,
                                                 std::string_view name) {
  const PropertyDict* usage = answer ? answer->dict() : nullptr;
  const Number* bytes = usage != nullptr ? usage->findNumber(name) : nullptr;
  return bytes != nullptr ? std::optional(bytes->asInt64() >> 20) : std::nullopt;
}

}  // namespace vesprun
