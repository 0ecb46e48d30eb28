#pragma once

namespace vesprun {

/// The event loop of the main thread.
class MainLoop {
 public:
  enum class SliceResult { HandledEvent, TimedOut };

  virtual ~MainLoop() = default;

  /// Waits for one event (a delivered message), `seconds` at most.
  virtual SliceResult runMainLoopSlice(double seconds) = 0;
};

}  // namespace vesprun
