#pragma once

#include <cstdint>

#include "common/PropertyDict.h"

namespace vesprun {

/// The size and fullness of the user data volume. Always six numbers, 0 where nothing is known:
/// - "HLT_OR_AmountDataAvailable_MB": space available to the user, in units of 1,048,576 bytes;
/// - "HLT_OR_Diskfullness_BP" and "HLT_Diskfullness_BP": the share in use, in 1/10,000;
/// - "HLT_OR_Capacity_GB" and "HLT_Capacity_GB": the nominal capacity, see `GetUserCapacityInGB`;
/// - "HLT_UserCapacity_MB": the size, in units of 1,048,576 bytes.
///
/// They are measured on the file system of /private/var (unsigned 64-bit numbers). When that fails,
/// or finds no capacity or less than 1/10,000 in use, the answer to "DiskUsage" is given instead
/// (unsigned 32-bit capacities, the others signed 64-bit).
PropertyDict GetDiskInfo();

/// The nominal capacity in GB of a user area of so many MB, of which the low 32 bits count: 1536
/// from 1,376,256 to 1,770,495 MB, else the power of two MB above it in units of 1024 MB. The power
/// of two is worked out in 64 bits, so it goes on up to 4,194,304 GB.
std::uint32_t GetUserCapacityInGB(std::uint64_t userCapacityMB);

}  // namespace vesprun
