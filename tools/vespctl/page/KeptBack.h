#pragma once

#include <string>
#include <vector>

#include "platform/host/HostPlatform.h"

namespace vesprun {

/// A key of the counter database that the whitelist keeps on the device.
struct KeptBack {
  bool isDistribution;
  std::string key;
};

/// The keys of all days that the database has, scalars before distributions. Without a usable
/// whitelist they are all of them, and the platform's system log has the reason. Throws
/// `CommandFailure` when the database cannot be read.
std::vector<KeptBack> keysKeptBack(HostPlatform& device);

}  // namespace vesprun
