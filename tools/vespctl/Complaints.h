#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "platform/SystemLog.h"

namespace vesprun {

/// Collects the errors that a service logs, for the command to report.
class Complaints final : public SystemLog {
 public:
  /// `also`, unless null, gets all that is logged.
  explicit Complaints(SystemLog* also = nullptr) : _also(also) {}

  bool keeps(LogLevel level) const override;
  void write(LogLevel level, std::string_view message) override;

  /// Throws the first error as `CommandFailure`.
  void failIfAny() const;
  /// Throws all errors and, unless the last one begins with it, `error`.
  [[noreturn]] void fail(const std::string& error) const;
  /// Prints them, when the command succeeded nevertheless.
  void print() const;

 private:
  SystemLog* _also;
  std::vector<std::string> _messages;
};

}  // namespace vesprun
