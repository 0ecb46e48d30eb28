#pragma once

#include "platform/ProcessInformation.h"

namespace vesprun {

/// The running Linux process.
class HostProcessInformation : public ProcessInformation {
 public:
  std::string processName() override;
  std::int32_t processIdentifier() override;
};

}  // namespace vesprun
