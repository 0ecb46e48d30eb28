#pragma once

namespace vesprun {

/// Lets one process at a time do the day's work.
class DailyWorkLock {
 public:
  virtual ~DailyWorkLock() = default;

  /// Takes the lock, waiting `seconds` at most, and holds it until the services have written what
  /// they held back at the platform's end. False when another process keeps it that long. A lock
  /// that the system cannot give is an error line and counts as taken: the work must be done.
  virtual bool lock(double seconds) = 0;
};

}  // namespace vesprun
