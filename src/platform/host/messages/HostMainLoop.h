#pragma once

#include <deque>
#include <functional>
#include <map>

#include "platform/MainLoop.h"

namespace vesprun {

/// The main thread's event loop: a queue of work, and file descriptors whose readiness leads to
/// more work. Everything here happens on the thread that runs the loop.
///
/// An event is one piece of queued work, such as the delivery of a message. Readiness alone is
/// none: a peer that sends bytes which never become a message does not prolong a slice. Time is
/// measured by the monotonic clock, and the thread sleeps while there is nothing to do.
class HostMainLoop final : public MainLoop {
 public:
  using Work = std::function<void()>;

  /// A number of seconds that is not above 0, or is none, looks once at what is ready already.
  SliceResult runMainLoopSlice(double seconds) override;

  /// Queues work; each slice does one piece, in the order in which they were queued.
  void queueWork(Work work) { _queue.push_back(std::move(work)); }

  /// Calls `whenReady` during slices whenever `descriptor` has something to read, has been hung up
  /// or has failed. It must not block; it may watch and unwatch any descriptor, also its own.
  /// Watching a descriptor again replaces what is called.
  void watch(int descriptor, Work whenReady);

  /// Ends the watch; must come before the descriptor is closed.
  void unwatch(int descriptor);

 private:
  bool doQueuedWork();
  void waitForReadiness(double seconds);

  std::deque<Work> _queue;
  std::map<int, Work> _watched;
};

}  // namespace vesprun
