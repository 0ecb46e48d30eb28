#pragma once

#include <string>
#include <string_view>

#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// The document of a whitelist that lets every figure of the running system through, coarsely, with
/// a comment on what each is good for.
std::string starterWhitelist();

/// Makes a document the whitelist of a device. Throws `CommandFailure` when that failed.
void writeWhitelist(const DeviceDirectory& directory, std::string_view document);

}  // namespace vesprun
