#pragma once

#include <string>

#include "FleetStore.h"

namespace vesprun {

/// The whole HTML document of what the devices reported. Nothing on it is of fewer devices than the
/// store's least number.
std::string fleetPage(FleetStore& store, const std::string& title);

}  // namespace vesprun
