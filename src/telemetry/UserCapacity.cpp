#include "telemetry/UserCapacity.h"

#include <bit>

namespace vesprun {

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

}  // namespace vesprun
