#pragma once

#include <deque>
#include <functional>
#include <map>
#include <utility>

#include "platform/MessageService.h"

namespace vesprun {

/// The main thread's event loop: a queue of work, and file descriptors whose readiness leads to
/// more. An event is one piece of queued work, such as a message's delivery; bytes that never
/// become a message do not prolong a slice.
class HostMainLoop final : public MainLoop {
 public:
  using Work = std::function<void()>;

  /// With 0, a negative number or NaN, looks once at what is ready.
  SliceResult runMainLoopSlice(double seconds) override;

  /// Each slice does one piece, in order.
  void queueWork(Work work) { _queue.push_back(std::move(work)); }

  /// Calls `whenReady` during slices while `descriptor` is readable, hung up or failed. It must not
  /// block and may watch and unwatch any descriptor. Watching again replaces the call.
  void watch(int descriptor, Work whenReady) {
    _watched.insert_or_assign(descriptor, std::move(whenReady));
  }

  /// Call before the descriptor is closed.
  void unwatch(int descriptor) { _watched.erase(descriptor); }

 private:
  bool doQueuedWork();
  void waitForReadiness(double seconds);

  std::deque<Work> _queue;
  std::map<int, Work> _watched;
};

}  // namespace vesprun
