#pragma once

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

#include "platform/Guarded.h"
#include "platform/Murmur.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

/// Answers every query, whatever its filter, with the described records, as late as described or
/// never, on a thread of its own. When it ends, it waits for running handlers and drops the others.
class HostMurmur final : public Murmur {
 public:
  /// The references, and all that handlers use, must outlive the object.
  HostMurmur(const DeviceDescription& description, SystemLog& log)
      : _feed(std::make_shared<Feed>(description, log)) {}
  ~HostMurmur() override { _feed->end(); }
  HostMurmur(const HostMurmur&) = delete;
  HostMurmur& operator=(const HostMurmur&) = delete;

  std::shared_ptr<UsageFeed> createUsageFeed(const UsageWorkspace& /*workspace*/) override {
    return _feed;
  }

 private:
  /// Holds the threads of replies. Handlers that keep it may outlive the service; by then it holds
  /// none.
  class Feed final : public UsageFeed {
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
      constexpr double kMaxDelay = 1e8;  // three years; far more would overflow the clock
      const std::chrono::duration<double> delay(std::min(_usage->delaySeconds, kMaxDelay));
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

  std::shared_ptr<Feed> _feed;
};

}  // namespace vesprun
