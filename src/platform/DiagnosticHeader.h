#pragma once

#include <string>

namespace vesprun {

/// The values that every diagnostic log has in its header.
class DiagnosticHeader {
 public:
  virtual ~DiagnosticHeader() = default;

  /// The identifier of this device, with a word of what it is in front when `withDescription`.
  virtual std::string GetSysIDWithDescription(bool withDescription) = 0;

  virtual std::string GetHardwareModel() = 0;

  /// The running version of the system, as it names itself.
  virtual std::string GetSystemVersion() = 0;

  /// A new identifier for each log.
  virtual std::string GetIncidentID() = 0;
};

}  // namespace vesprun
