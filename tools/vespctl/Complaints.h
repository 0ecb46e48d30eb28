#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "platform/SystemLog.h"

namespace vesprun {

/// Takes the errors that a service logs, which become the command's own.
class Complaints final : public SystemLog {
 public:
  /// `also` gets all that is logged too, unless it is null.
  explicit Complaints(SystemLog* also = nullptr) : _also(also) {}

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
  std::vector<std::string> _messages;
};

}  // namespace vesprun
