#pragma once

#include "common/Date.h"
#include "common/PropertyDict.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// Writes the buffers of a storage controller, in its second year of use at `now`, under
/// `controller/` of a device directory, and returns the entry of "registry" in the device's
/// description that goes with them: a controller of the first class with its EAN service. All
/// buffers are made from the same few figures, so they agree with each other.
/// Throws `CommandFailure` when a file cannot be written.
PropertyDict writeSampleController(const DeviceDirectory& directory, const Date& now);

}  // namespace vesprun
