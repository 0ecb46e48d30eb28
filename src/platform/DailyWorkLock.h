#pragma once

namespace vesprun {

/// Lets one process at a time do the day's work.
class DailyWorkLock {
 public:
  virtual ~DailyWorkLock() = default;

  /// Takes the lock, waiting `seconds` at most, and holds it until the platform has ended and its
  /// services have written what they held back, or until the process ends. False when another
  /// process holds it that long. A lock that the system cannot give is an error line and counts as
  /// taken: the work must still be done.
  virtual bool lock(double seconds) = 0;
};

}  // namespace vesprun
