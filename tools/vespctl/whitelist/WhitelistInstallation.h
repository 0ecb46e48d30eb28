#pragma once

#include <string>
#include <string_view>

#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// Makes a document the device's whitelist, in one step, with the owner, the group and the mode of
/// the directory. The one before stays beside it, and `previous` becomes its path, or stays empty.
/// False, with a text in `error` and the whitelist unchanged, on failure.
bool installWhitelist(const DeviceDirectory& directory, std::string_view document,
                      std::string& previous, std::string& error);

}  // namespace vesprun
