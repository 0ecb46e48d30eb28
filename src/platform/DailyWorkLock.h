#pragma once

namespace vesprun {

/// Lets one process at a time do the day's work.
class DailyWorkLock {
 public:
  virtual ~DailyWorkLock() = default;

  /// Takes the lock, waiting `seconds` at most, and holds it until the platform ends, when all that
  /// its services held back is written; or until the process does, however it ends. False when
  /// another process has it for that long. A lock that the system cannot give is an error line and
  /// counts as taken: the work must still be done.
  virtual bool lock(double seconds) = 0;
};

}  // namespace vesprun
