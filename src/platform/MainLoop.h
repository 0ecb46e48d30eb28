#pragma once

namespace vesprun {

/// The event loop of the main thread.
class MainLoop {
 public:
  enum class SliceResult { HandledEvent, TimedOut };

  virtual ~MainLoop() = default;

  /// Waits until one event (a delivered message) has been handled or `seconds` have passed without
  /// one, and tells which.
  virtual SliceResult runMainLoopSlice(double seconds) = 0;
};

}  // namespace vesprun
