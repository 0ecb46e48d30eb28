#pragma once

#include <cstdint>
#include <exception>
#include <string>
#include <string_view>

namespace vesprun {

/// From the gravest to the least; a log that keeps one level keeps all graver ones.
enum class LogLevel : std::uint8_t { Error, Default, Notice, Info, Debug };

/// The platform's system log. Writing never fails as far as the caller can tell, and is possible
/// from any thread.
class SystemLog {
 public:
  virtual ~SystemLog() = default;

  /// False when a message of this level would be dropped: its text need not be formed.
  virtual bool keeps(LogLevel level) const = 0;

  virtual void write(LogLevel level, std::string_view message) = 0;
};

/// Forms a printf-style message and writes it to the installed platform's log. Nothing is formed
/// when the level is not kept. A text form of a value ("%@") is passed as %s.
[[gnu::format(printf, 2, 3)]] void logMessage(LogLevel level, const char* format, ...);

}  // namespace vesprun
