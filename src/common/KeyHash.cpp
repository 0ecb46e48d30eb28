#include "common/KeyHash.h"

#include <random>

namespace vesprun {

std::uint64_t KeyHash::randomNumber() {
  std::random_device random;
  return std::uint64_t{random()} << 32 | random();
}

}  // namespace vesprun
