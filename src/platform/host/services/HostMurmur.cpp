#include "platform/host/services/HostMurmur.h"

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

#include "platform/Guarded.h"

namespace vesprun {

/// Holds the threads of replies. Handlers that keep it may outlive the service; by then it holds
/// none.
class HostMurmur::Feed final : public UsageFeed {
 public:
  Feed(const DeviceDescription& description, SystemLog& log)
      : _usage(describedOr(description.usage, [] { return std::optional(UsageDescription()); })),
        _log(log) {}

  void usageToDateForNameKindReply(const std::set<std::string>& /*names*/, UsageNameKind /*kind*/,
                                   ReplyHandler handler) override {
    const std::lock_guard lock(_mutex);
    if (_ended || !_usage) {
      return;
    }
    try {
      _threads.emplace_back([this, handler = std::move(handler)] { reply(handler); });
    } catch (const std::system_error& error) {
      _log.write(LogLevel::Error, std::string("no thread for the usage feed: ") + error.what());
    }
  }

  void end() {
    std::vector<std::thread> threads;
    {
      const std::lock_guard lock(_mutex);
      _ended = true;
      threads.swap(_threads);
    }
    _endedChanged.notify_all();
    for (std::thread& thread : threads) {
      thread.join();
    }
  }

 private:
  void reply(const ReplyHandler& handler) {
    constexpr double kLongestDelay = 1e8;  // three years; far more would overflow the clock
    const std::chrono::duration<double> delay(std::min(_usage->delaySeconds, kLongestDelay));
    {
      std::unique_lock lock(_mutex);
      if (_endedChanged.wait_for(lock, delay, [this] { return _ended; })) {
        return;
      }
    }
    runGuarded(_log, "usage feed", [&] { handler(&_usage->records); });
  }

  const std::optional<UsageDescription> _usage;  ///< nothing: it never replies
  SystemLog& _log;
  std::mutex _mutex;
  std::condition_variable _endedChanged;
  bool _ended = false;
  std::vector<std::thread> _threads;
};

HostMurmur::HostMurmur(const DeviceDescription& description, SystemLog& log)
    : _feed(std::make_shared<Feed>(description, log)) {}

HostMurmur::~HostMurmur() { _feed->end(); }

std::shared_ptr<UsageFeed> HostMurmur::createUsageFeed(const UsageWorkspace& /*workspace*/) {
  return _feed;
}

}  // namespace vesprun
