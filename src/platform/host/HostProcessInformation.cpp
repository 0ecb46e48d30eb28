#include "platform/host/HostProcessInformation.h"

#include <errno.h>
#include <unistd.h>

namespace vesprun {

std::string HostProcessInformation::processName() { return program_invocation_short_name; }

std::int32_t HostProcessInformation::processIdentifier() { return getpid(); }

}  // namespace vesprun
