#pragma once

#include <span>

namespace vesprun {

/// The main loop of the listener mode ends after so many seconds without a message.
inline constexpr double kQuietSeconds = 10.0;

/// The job of one process, on the installed platform. `commandLine` is the process's own, the
/// program name first. Only the argument behind it counts:
///
/// - none: `runListenerMode`;
/// - "-d": the day check, without app info;
/// - "-f", "-t": the daily tasks for yesterday, for today; the stored day is left alone;
/// - any other: the system log says so, and nothing runs.
///
/// Without even a program name nothing runs. Failures are told in the system log; nothing is thrown
/// and there is no result: the exit status of the job is always 0.
void runDailyDriver(std::span<const char* const> commandLine) noexcept;

/// Offers the service of the active-app-info messages and runs the main loop until a slice of
/// `quietSeconds` has passed without an event. If app info was requested and never came, runs the
/// day check without it. A service that cannot be offered changes nothing else.
void runListenerMode(double quietSeconds = kQuietSeconds);

}  // namespace vesprun
