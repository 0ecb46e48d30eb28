#pragma once

#include <string>

#include "store/FleetStore.h"

namespace vesprun {

/// The whole HTML document of what the devices reported. It only tells of at least as many devices
/// as the store's least number says.
std::string fleetPage(FleetStore& store, const std::string& title);

}  // namespace vesprun
