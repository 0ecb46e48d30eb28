#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "platform/SystemLog.h"

namespace vesprun {

/// Collects what services log, down to a level, for the command to report. A message that is
/// repeated at once counts once.
class Complaints final : public SystemLog {
 public:
  /// `also`, unless null, gets all that is logged.
  explicit Complaints(SystemLog* also = nullptr, LogLevel least = LogLevel::Error)
      : _also(also), _least(least) {}

  bool keeps(LogLevel level) const override;
  void write(LogLevel level, std::string_view message) override;

  /// Throws the first error as `CommandFailure`.
  void failIfAny() const;
  /// Throws all errors followed by `error`, unless the last one begins with it.
  [[noreturn]] void fail(const std::string& error) const;
  /// Prints them, for a command that succeeded nevertheless.
  void print() const;

 private:
  SystemLog* _also;
  LogLevel _least;
  std::vector<std::string> _messages;
};

}  // namespace vesprun
