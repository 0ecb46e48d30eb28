#pragma once

#include <cstdint>

namespace vesprun {

/// A handle of a registry object (an entry or an iterator) or of a user-client connection of the
/// device registry; 0 is none.
using RegistryHandle = std::uint32_t;

}  // namespace vesprun
