#pragma once

namespace vesprun {

/// True on a device with an internal build ("InternalBuild"). The platform is asked once; the
/// answer holds until the process ends.
bool TBIsInternalDevice();

}  // namespace vesprun
