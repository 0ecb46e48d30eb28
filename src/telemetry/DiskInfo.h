#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The size and fullness of the user data volume: always six numbers, 0 when unknown.
///
/// - "HLT_OR_AmountDataAvailable_MB": space available to the user, in MiB;
/// - "HLT_OR_Diskfullness_BP" and "HLT_Diskfullness_BP": the share in use, in 1/10,000;
/// - "HLT_OR_Capacity_GB" and "HLT_Capacity_GB": the nominal capacity (`GetUserCapacityInGB`);
/// - "HLT_UserCapacity_MB": the size, in MiB.
///
/// Measured on the file system of /private/var (unsigned 64-bit numbers). If that fails, or finds
/// no capacity or less than 1/10,000 in use: the answer to "DiskUsage" (unsigned 32-bit capacities,
/// the others signed 64-bit).
PropertyDict GetDiskInfo();

/// The nominal capacity in GB of a user area of so many MB (low 32 bits): 1536 from 1,376,256 to
/// 1,770,495 MB, else the next power of two MB above, in units of 1024 MB, up to 4,194,304 GB.
std::uint32_t GetUserCapacityInGB(std::uint64_t userCapacityMB);

/// A byte count of an answer to "DiskUsage" (`OrreryCopyAnswer`) in MiB, rounded down; nothing
/// without a dictionary or a number of that name.
std::optional<std::int64_t> diskUsageInMebibytes(const std::optional<PropertyValue>& answer,
                                                 std::string_view name);

}  // namespace vesprun
