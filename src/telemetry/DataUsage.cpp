#include "telemetry/DataUsage.h"

#include <array>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include "common/Calendar.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::string_view kBaselineKey = "netUsageBaseline";
constexpr std::string_view kBaselineDomain = "com.quill.logsmith.vesprun";

constexpr std::array<std::string_view, 4> kUsageCounters = {"wifiInBytes", "wifiOutBytes",
                                                            "wwanInBytes", "wwanOutBytes"};

/// Waits by the monotonic clock: setting the time of day makes the wait neither longer nor shorter.
class Semaphore {
 public:
  void signal() {
    const std::lock_guard lock(_mutex);
    _signaled = true;
    _changed.notify_all();
  }

  /// False when `timeout` has passed without a signal.
  bool waitFor(std::chrono::nanoseconds timeout) {
    std::unique_lock lock(_mutex);
    return _changed.wait_until(lock, std::chrono::steady_clock::now() + timeout,
                               [this] { return _signaled; });
  }

 private:
  std::mutex _mutex;
  std::condition_variable _changed;
  bool _signaled = false;
};

std::int64_t counterOf(const PropertyValue* value) {
  return value != nullptr && value->number() != nullptr ? value->number()->asInt64() : 0;
}

/// What a process is called in counter keys.
struct UsageName {
  std::string prefix;
  std::string name;
};

std::optional<UsageName> nameOf(const PropertyDict& record) {
  const auto text = [&record](std::string_view key) {
    const PropertyValue* value = record.find(key);
    return value != nullptr ? value->string() : nullptr;
  };
  if (const std::string* bundle = text("bundleName")) {
    return UsageName{"", *bundle};
  }
  if (const std::string* process = text("procName")) {
    return UsageName{"com.quill.", *process};
  }
  return std::nullopt;
}

/// What a baseline remembers of a process: the date from which its counters count, and the
/// counters.
class BaselineEntry {
 public:
  explicit BaselineEntry(const PropertyValue* stored)
      : _values(stored != nullptr ? stored->array() : nullptr) {}

  bool isSince(const Date& date) const {
    return _values != nullptr && !_values->empty() && _values->front().date() != nullptr &&
           *_values->front().date() == date;
  }

  std::int64_t counter(std::size_t index) const {
    return index + 1 < _values->size() ? counterOf(&(*_values)[index + 1]) : 0;
  }

 private:
  const PropertyArray* _values;
};

/// Handles one reply of the feed.
class UsageReply {
 public:
  UsageReply(Tallybook& tallybook, Preferences& preferences)
      : _tallybook(tallybook), _preferences(preferences) {}

  void handle(const PropertyArray* records) {
    _yesterday = std::int64_t{_tallybook.TBDaysSince1970()} - 1;
    const auto stored = _preferences.LGSPreferencesGetValue(kBaselineKey, kBaselineDomain);
    if (stored && stored->dict() != nullptr) {
      _baseline = *stored->dict();
    }
    if (records != nullptr) {
      for (const PropertyValue& record : *records) {
        if (record.dict() != nullptr) {
          count(*record.dict());
        }
      }
    }
    // Before the baseline: a process that is killed in between counts growth again, and loses none.
    _tallybook.TBClientCheckpoint();
    _preferences.LGSPreferencesSetValue(kBaselineKey, std::move(_newBaseline), kBaselineDomain);
    _preferences.LGSPreferencesSynchronize(kBaselineDomain);
  }

 private:
  void count(const PropertyDict& record) {
    const std::optional<UsageName> name = nameOf(record);
    const PropertyValue* sinceValue = record.find(kUsageSinceKey);
    const Date* since = sinceValue != nullptr ? sinceValue->date() : nullptr;
    if (!name || since == nullptr) {
      return;
    }
    const BaselineEntry before(_baseline.find(name->name));
    const bool goesOn = before.isSince(*since);
    const bool isRecent = daysSince1970(*since) >= _yesterday;
    PropertyArray after{*since};
    for (std::size_t i = 0; i < kUsageCounters.size(); ++i) {
      const std::int64_t value = counterOf(record.find(kUsageCounters[i]));
      after.emplace_back(value);
      if (goesOn) {
        addGrowth(kUsageCounters[i], *name, value, before.counter(i));
      } else if (isRecent) {
        AddDataUsageKB(kUsageCounters[i], name->prefix, name->name, value);
      }
    }
    if (!goesOn && !isRecent) {
      addOne("datausage.olddata.", *name);
    }
    _newBaseline.set(name->name, std::move(after));
  }

  void addGrowth(std::string_view counter, const UsageName& name, std::int64_t value,
                 std::int64_t before) {
    // Modulo 2^64: counters far apart must not overflow.
    const auto growth = static_cast<std::int64_t>(static_cast<std::uint64_t>(value) -
                                                  static_cast<std::uint64_t>(before));
    if (growth >= 1) {
      AddDataUsageKB(counter, name.prefix, name.name, growth);
    } else if (growth < 0) {
      addOne("datausage.baddata.", name);
    }
  }

  void addOne(std::string_view key, const UsageName& name) {
    _tallybook.TBClientAddValueForScalarKey(std::string(key) + name.prefix + name.name, 1);
  }

  void AddDataUsageKB(std::string_view counterName, std::string_view prefix, std::string_view name,
                      std::int64_t bytes) {
    const auto end = counterName.find("Bytes");
    if (end == std::string_view::npos || (bytes >= -1023 && bytes <= 1023)) {
      return;
    }
    std::string key = "datausage.";
    key.append(counterName.substr(0, end)).append("KB.").append(prefix).append(name);
    _tallybook.TBClientAddValueForScalarKey(key, bytes / 1024);
  }

  Tallybook& _tallybook;
  Preferences& _preferences;
  std::int64_t _yesterday = 0;
  PropertyDict _baseline;
  PropertyDict _newBaseline;
};

}  // namespace

void CollectDataUsage(std::chrono::nanoseconds replyTimeout) {
  const auto workspace = platform().murmur().createUsageWorkspace(kUsageServiceEndpoint);
  const auto feed = platform().murmur().createUsageFeed(workspace);
  const auto handled = std::make_shared<Semaphore>();
  // The services are asked for here: a late reply may find another platform installed, or none.
  const auto reply = [feed, workspace, handled, &tallybook = platform().tallybook(),
                      &preferences = platform().preferences()](const PropertyArray* records) {
    UsageReply(tallybook, preferences).handle(records);
    handled->signal();
  };
  feed->usageToDateForNameKindReply({}, UsageNameKind::Process, reply);
  if (!handled->waitFor(replyTimeout)) {
    logMessage(LogLevel::Default, "Murmur timed out, no datausage available");
  }
}

}  // namespace vesprun
