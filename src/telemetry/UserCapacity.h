#pragma once

#include <cstdint>

namespace vesprun {

/// The nominal capacity in GB of a user area of so many MB, of which the low 32 bits count: 1536
/// from 1,376,256 to 1,770,495 MB, else the power of two MB above it in units of 1024 MB. The power
/// of two is worked out in 64 bits, so it goes on up to 4,194,304 GB.
std::uint32_t GetUserCapacityInGB(std::uint64_t userCapacityMB);

}  // namespace vesprun
