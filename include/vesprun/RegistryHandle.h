#pragma once

#include <cstdint>

namespace vesprun {

/// A handle of a registry object or user-client connection; 0: none.
using RegistryHandle = std::uint32_t;

}  // namespace vesprun
