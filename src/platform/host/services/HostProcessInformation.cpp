#include "platform/host/services/HostProcessInformation.h"

#include <unistd.h>

namespace vesprun {

std::string HostProcessInformation::processName() { return "vesprun"; }

std::int32_t HostProcessInformation::processIdentifier() { return getpid(); }

}  // namespace vesprun
