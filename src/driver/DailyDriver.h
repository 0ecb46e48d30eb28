#pragma once

#include <span>

namespace vesprun {

/// The listener mode ends after this time without a message, in seconds.
inline constexpr double kQuietSeconds = 10.0;

/// The job of a process. `commandLine` begins with the program name, without which nothing runs.
/// Only the next argument counts:
///
/// - none: `runListenerMode`;
/// - "-d": the day check, without app info;
/// - "-f", "-t": the daily tasks for yesterday or today; the stored day stays;
/// - any other: a line in the system log, where failures go as well.
void runDailyDriver(std::span<const char* const> commandLine) noexcept;

/// Offers the service for active-app-info messages and runs the main loop until `quietSeconds` pass
/// without an event, also when the service cannot be offered. Then runs the day check if requested
/// app info never came.
void runListenerMode(double quietSeconds = kQuietSeconds);

}  // namespace vesprun
