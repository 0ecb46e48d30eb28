#pragma once

#include "common/Calendar.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// Writes the description of a sample device, as it is at `now`, and the files that go with it: the
/// storage controller, a kernel snapshot and kernel ECC events. Throws `CommandFailure` when a file
/// cannot be written.
void describeSampleDevice(const DeviceDirectory& directory, const Date& now);

}  // namespace vesprun
