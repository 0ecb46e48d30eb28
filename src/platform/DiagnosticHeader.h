#pragma once

#include <string>

namespace vesprun {

/// The header values of every diagnostic log.
class DiagnosticHeader {
 public:
  virtual ~DiagnosticHeader() = default;

  /// The device's identifier; `withDescription` puts a word before it that says what it identifies.
  virtual std::string GetSysIDWithDescription(bool withDescription) = 0;

  virtual std::string GetHardwareModel() = 0;

  /// The running version of the system, as it names itself.
  virtual std::string GetSystemVersion() = 0;

  /// A new identifier for each log.
  virtual std::string GetIncidentID() = 0;
};

}  // namespace vesprun
