#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "platform/SystemLog.h"

namespace vesprun {

/// Takes what a service logs, which becomes the command's own: errors, or down to another level. A
/// message that is repeated at once counts once.
class Complaints final : public SystemLog {
 public:
  /// `also` gets all that is logged too, unless it is null.
  explicit Complaints(SystemLog* also = nullptr, LogLevel least = LogLevel::Error)
      : _also(also), _least(least) {}

  bool keeps(LogLevel level) const override;
  void write(LogLevel level, std::string_view message) override;

  /// Throws `CommandFailure` with the first of them.
  void failIfAny() const;
  /// Throws `CommandFailure` with all of them and, unless the last one says so already, `error`.
  [[noreturn]] void fail(const std::string& error) const;
  /// Each on standard error, of a command that is done nevertheless.
  void print() const;

 private:
  SystemLog* _also;
  LogLevel _least;
  std::vector<std::string> _messages;
};

}  // namespace vesprun
