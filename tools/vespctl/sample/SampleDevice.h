#pragma once

#include <string>

namespace vesprun {

/// Fills a device directory, just made, with a whitelist, the counters of two days and repeated
/// readings. Throws `CommandFailure`.
void fillSampleDevice(const std::string& directory);

}  // namespace vesprun
