#pragma once

#include <string>

#include "platform/host/HostPlatform.h"

namespace vesprun {

/// For people: why a device without daily logs has none, and when the first one comes. Empty when
/// it has one.
std::string whenFirstReport(HostPlatform& device);

}  // namespace vesprun
