#pragma once

namespace vesprun {

/// True on an internal build ("InternalBuild"). The platform is asked once.
bool TBIsInternalDevice();

}  // namespace vesprun
