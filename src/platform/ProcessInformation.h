#pragma once

#include <cstdint>
#include <string>

namespace vesprun {

/// The process that the program runs in.
class ProcessInformation {
 public:
  virtual ~ProcessInformation() = default;

  /// The name of the program, without its folder.
  virtual std::string processName() = 0;

  virtual std::int32_t processIdentifier() = 0;
};

}  // namespace vesprun
