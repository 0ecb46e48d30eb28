#include "platform/host/messages/HostMainLoop.h"

#include <poll.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cmath>
#include <thread>
#include <utility>
#include <vector>

namespace vesprun {
namespace {

using MonotonicClock = std::chrono::steady_clock;
using Seconds = std::chrono::duration<double>;

constexpr double kPauseAfterFailure = 0.1;

}  // namespace

MainLoop::SliceResult HostMainLoop::runMainLoopSlice(double seconds) {
  const double length = seconds > 0 ? seconds : 0;  // 0 for NaN as well
  const auto start = MonotonicClock::now();
  for (bool looked = false; !doQueuedWork(); looked = true) {
    const double left = length - Seconds(MonotonicClock::now() - start).count();
    if (looked && left <= 0) {
      return SliceResult::TimedOut;
    }
    waitForReadiness(std::max(left, 0.0));
  }
  return SliceResult::HandledEvent;
}

bool HostMainLoop::doQueuedWork() {
  if (_queue.empty()) {
    return false;
  }
  const Work work = std::move(_queue.front());
  _queue.pop_front();
  work();
  return true;
}

void HostMainLoop::waitForReadiness(double seconds) {
  std::vector<pollfd> descriptors;
  descriptors.reserve(_watched.size());
  for (const auto& [descriptor, whenReady] : _watched) {
    descriptors.push_back({descriptor, POLLIN, 0});
  }
  const auto timeout = static_cast<int>(std::ceil(std::min(seconds * 1e3, 1e9)));
  const int ready = poll(descriptors.data(), descriptors.size(), timeout);
  if (ready < 0 && errno != EINTR) {
    // For instance out of memory: a pause keeps the loop from spinning.
    std::this_thread::sleep_for(Seconds(std::min(seconds, kPauseAfterFailure)));
  }
  if (ready <= 0) {
    return;
  }
  for (const pollfd& descriptor : descriptors) {
    // An earlier call may have ended this watch.
    const auto watched = _watched.find(descriptor.fd);
    if (descriptor.revents != 0 && watched != _watched.end()) {
      const Work whenReady = watched->second;  // a copy: it may end its own watch
      whenReady();
    }
  }
}

}  // namespace vesprun
