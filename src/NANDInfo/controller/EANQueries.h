#pragma once

#include <cstdint>

namespace vesprun {

// Images stored by the controller's EAN service, named by four-character codes (first character in
// the most significant byte). Each query opens and closes the service; a failure is a line in the
// system log, at default level, and the answer 0.

/// As the service reports it.
std::uint64_t GetEANImageSize(std::uint32_t code);

std::uint64_t GetEANUpdateCount(std::uint32_t code);

}  // namespace vesprun
