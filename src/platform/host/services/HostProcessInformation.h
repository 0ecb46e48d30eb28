#pragma once

#include "platform/ProcessInformation.h"

namespace vesprun {

/// The job's process on the device: it is vesprun there, whichever program runs it here.
class HostProcessInformation : public ProcessInformation {
 public:
  std::string processName() override;
  std::int32_t processIdentifier() override;
};

}  // namespace vesprun
