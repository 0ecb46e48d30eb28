#include "telemetry/DataUsage.h"

#include <array>
#include <limits>
#include <memory>
#include <optional>
#include <semaphore>
#include <string>
#include <utility>
#include <vector>

#include "common/Calendar.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::string_view kBaselineKey = "netUsageBaseline";
constexpr std::string_view kMarkKey = "netUsageBaselineMark";
constexpr std::string_view kBaselineDomain = "com.quill.logsmith.vesprun";

constexpr std::array<std::string_view, 4> kUsageCounters = {"wifiInBytes", "wifiOutBytes",
                                                            "wwanInBytes", "wwanOutBytes"};

/// A process's name in counter keys.
struct UsageName {
  std::string prefix;
  std::string name;
};

std::optional<UsageName> nameOf(const PropertyDict& record) {
  if (const std::string* bundle = record.findString("bundleName")) {
    return UsageName{"", *bundle};
  }
  if (const std::string* process = record.findString("procName")) {
    return UsageName{"com.quill.", *process};
  }
  return std::nullopt;
}

/// Taken before the feed is asked: a late reply may find another platform, or none.
struct Services {
  Tallybook& tallybook = platform().tallybook();
  Preferences& preferences = platform().preferences();
  PtreeSerialization& serialization = platform().ptreeSerialization();

  std::optional<PropertyValue> stored(std::string_view key) const {
    return preferences.LGSPreferencesGetValue(key, kBaselineDomain);
  }
  void store(std::string_view key, std::optional<PropertyValue> value) const {
    preferences.LGSPreferencesSetValue(key, std::move(value), kBaselineDomain);
  }
  bool synchronize() const { return preferences.LGSPreferencesSynchronize(kBaselineDomain); }
};

// Counters and baseline lie in two files, and a process can be killed, or a write can fail, in
// between. So the baseline is written first, with a mark: the earlier baseline, and a fingerprint
// of the data-usage counters before the growth is added. Counters reach the database all or none:
// while the fingerprint is unchanged, the growth is not counted and the earlier baseline applies.
// The mark is removed when the counters are durable.

/// The data-usage counters from a day on as one number; nothing when they cannot be read.
std::optional<std::uint64_t> fingerprintSince(Tallybook& tallybook, std::int32_t day) {
  std::uint64_t hash = 0xCBF29CE484222325;  // FNV-1a
  const auto take = [&hash](std::uint64_t value) { hash = (hash ^ value) * 0x100000001B3; };
  const bool done =
      tallybook.initWithDefaultPath()
          ->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
              "datausage.", day, std::numeric_limits<std::int32_t>::max(),
              [&take](std::string_view key, std::int32_t rowDay, std::int64_t value, bool&) {
                for (const char byte : key) {
                  take(static_cast<std::uint8_t>(byte));
                }
                take(static_cast<std::uint32_t>(rowDay));
                take(static_cast<std::uint64_t>(value));
              });
  return done ? std::optional(hash) : std::nullopt;
}

/// Kept beside a baseline until its growth is counted.
struct CountingMark {
  std::int32_t day;
  std::uint64_t fingerprint;
  std::optional<PropertyValue> baselineBefore;

  PropertyDict dict() const {
    PropertyDict dict{{"day", day}, {"fingerprint", fingerprint}};
    if (baselineBefore) {
      dict.set("baselineBefore", *baselineBefore);
    }
    return dict;
  }
  static std::optional<CountingMark> of(const std::optional<PropertyValue>& stored) {
    const PropertyDict* dict = stored ? stored->dict() : nullptr;
    const Number* day = dict != nullptr ? dict->findNumber("day") : nullptr;
    const Number* fingerprint = dict != nullptr ? dict->findNumber("fingerprint") : nullptr;
    if (day == nullptr || fingerprint == nullptr) {
      return std::nullopt;
    }
    const PropertyValue* before = dict->find("baselineBefore");
    return CountingMark{day->asInt32(), fingerprint->asUInt64(),
                        before != nullptr ? std::optional(*before) : std::nullopt};
  }
};

/// Returns to the earlier baseline when an earlier run ended before its growth was counted. False
/// when the counters cannot be read.
bool settleEarlierRun(const Services& services) {
  if (const std::optional<CountingMark> mark = CountingMark::of(services.stored(kMarkKey))) {
    const auto fingerprint = fingerprintSince(services.tallybook, mark->day);
    if (!fingerprint) {
      return false;
    }
    if (fingerprint == mark->fingerprint) {
      services.store(kBaselineKey, mark->baselineBefore);
    }
    services.store(kMarkKey, std::nullopt);
  }
  return true;
}

class UsageReply {
 public:
  UsageReply(const Services& services, CountingMark mark)
      : _services(services), _mark(std::move(mark)) {}

  /// Adds the growth and sets the baseline.
  void handle(const PropertyArray* records) {
    _yesterday = std::int64_t{_services.tallybook.TBDaysSince1970()} - 1;
    _mark.baselineBefore = _services.stored(kBaselineKey);
    if (_mark.baselineBefore && _mark.baselineBefore->dict() != nullptr) {
      _baseline = *_mark.baselineBefore->dict();
    }
    if (records != nullptr) {
      for (const PropertyValue& record : *records) {
        if (record.dict() != nullptr) {
          count(*record.dict());
        }
      }
    }
    _services.store(kBaselineKey, std::move(_newBaseline));
    if (_hasGrowth) {
      _services.store(kMarkKey, _mark.dict());
    }
    if (!_services.synchronize()) {
      // Without a baseline the next run would count the growth again: leave it to that run.
      _services.store(kBaselineKey, std::move(_mark.baselineBefore));
      _services.store(kMarkKey, std::nullopt);
      _hasGrowth = false;
      return;
    }
    for (const auto& [key, value] : _additions) {
      _services.tallybook.TBClientAddValueForScalarKey(key, value);
    }
  }

  /// Makes the counters durable; may wait for the database.
  void finish() const {
    if (!_hasGrowth) {
      return;
    }
    _services.tallybook.TBClientCheckpoint();
    const auto fingerprint = fingerprintSince(_services.tallybook, _mark.day);
    if (fingerprint && fingerprint != _mark.fingerprint) {
      _services.store(kMarkKey, std::nullopt);
      _services.synchronize();
    }
  }

 private:
  void count(const PropertyDict& record) {
    const std::optional<UsageName> name = nameOf(record);
    const Date* since = record.findDate(kUsageSinceKey);
    if (!name || since == nullptr) {
      return;
    }
    // The date since which the counters count, and the counters.
    const PropertyArray* before = _baseline.findArray(name->name);
    const bool goesOn =
        before != nullptr && !before->empty() && before->front() == PropertyValue(*since);
    const bool isRecent = daysSince1970(*since) >= _yesterday;
    const std::size_t additionsBefore = _additions.size();
    PropertyArray after{*since};
    for (const std::string_view counter : kUsageCounters) {
      const std::size_t place = after.size();
      const std::int64_t value = record.integerOr(counter, 0);
      after.emplace_back(value);
      if (goesOn) {
        const Number* earlier = place < before->size() ? (*before)[place].number() : nullptr;
        addGrowth(counter, *name, value, earlier != nullptr ? earlier->asInt64() : 0);
      } else if (isRecent) {
        AddDataUsageKB(counter, name->prefix, name->name, value);
      }
    }
    if (!goesOn && !isRecent) {
      addOne("datausage.olddata.", *name);
    }
    std::string error;
    if (_services.serialization.canSerialize({PropertyDict{{name->name, after}}}, error)) {
      _newBaseline.set(name->name, std::move(after));
      _hasGrowth = _hasGrowth || _additions.size() > additionsBefore;
    }
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
    _additions.emplace_back(std::string(key) + name.prefix + name.name, 1);
  }

  void AddDataUsageKB(std::string_view counterName, std::string_view prefix, std::string_view name,
                      std::int64_t bytes) {
    const auto end = counterName.find("Bytes");
    if (end == std::string_view::npos || (bytes >= -1023 && bytes <= 1023)) {
      return;
    }
    std::string key = "datausage.";
    key.append(counterName.substr(0, end)).append("KB.").append(prefix).append(name);
    _additions.emplace_back(std::move(key), bytes / 1024);
  }

  Services _services;
  CountingMark _mark;
  std::int64_t _yesterday = 0;
  PropertyDict _baseline;
  PropertyDict _newBaseline;
  std::vector<std::pair<std::string, std::int64_t>> _additions;
  bool _hasGrowth = false;  ///< of a process that the new baseline holds
};

}  // namespace

void CollectDataUsage(std::chrono::nanoseconds replyTimeout) {
  const Services services;
  const std::int32_t today = services.tallybook.TBDaysSince1970();
  const auto fingerprint =
      settleEarlierRun(services) ? fingerprintSince(services.tallybook, today) : std::nullopt;
  if (!fingerprint) {
    return;  // the counters cannot be read: the next run counts the growth
  }
  const auto feed = platform().murmur().createUsageFeed(UsageWorkspace{kUsageServiceEndpoint});
  const auto handled = std::make_shared<std::binary_semaphore>(0);
  const auto reply = [feed, handled, services,
                      mark = CountingMark{today, *fingerprint, {}}](const PropertyArray* records) {
    UsageReply usageReply(services, mark);
    usageReply.handle(records);
    handled->release();
    usageReply.finish();
  };
  feed->usageToDateForNameKindReply({}, UsageNameKind::Process, reply);
  if (!handled->try_acquire_for(replyTimeout)) {
    logMessage(LogLevel::Default, "Murmur timed out, no datausage available");
  }
}

}  // namespace vesprun
