#pragma once

#include <cstdint>
#include <string_view>

namespace vesprun {

/// Most severe first; keeping a level keeps all more severe ones.
enum class LogLevel : std::uint8_t { Error, Default, Notice, Info, Debug };

inline constexpr std::string_view kLogLevelNames[] = {"error", "default", "notice", "info",
                                                      "debug"};

/// The system log. Writing never fails for the caller and is safe from any thread.
class SystemLog {
 public:
  virtual ~SystemLog() = default;

  /// False when messages of this level are dropped, so that their text need not be formed.
  virtual bool keeps(LogLevel level) const = 0;

  virtual void write(LogLevel level, std::string_view message) = 0;
};

}  // namespace vesprun
