#include "platform/host/counters/HostTallybook.h"

#include <optional>

#include "common/Calendar.h"
#include "platform/Guarded.h"

namespace vesprun {
class HostTallybook::History final : public TBHistory {
 public:
  explicit History(HostTallybook& tallybook) : _tallybook(tallybook) {}

  bool scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
      std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
      const ScalarRowHandler& rowHandler) override {
    return read(
        [&](CounterStore& store) { store.readScalars(keyPrefix, minDay, maxDay, rowHandler); });
  }

  bool distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
      std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
      const DistributionRowHandler& rowHandler) override {
    return read([&](CounterStore& store) {
      store.readDistributions(keyPrefix, minDay, maxDay, rowHandler);
    });
  }

 private:
  bool read(const std::function<void(CounterStore&)>& work) {
    std::string error;
    const bool done = _tallybook.read(work, error);
    if (!done) {
      _tallybook._log.write(LogLevel::Error, "counters cannot be read: " + error);
    }
    return done;
  }

  HostTallybook& _tallybook;
};

HostTallybook::HostTallybook(const DeviceDirectory& directory, Clock& clock,
                             Preferences& preferences, SystemLog& log,
                             std::chrono::milliseconds longestWait)
    : _clock(clock), _preferences(preferences), _log(log), _file(directory, clock, longestWait) {}

HostTallybook::~HostTallybook() {
  runGuarded(_log, "counters", [this] {
    std::string error;
    if (!checkpoint(error)) {
      const std::size_t lost = _pending.scalars.size() + _pending.samples.size();
      _log.write(LogLevel::Error,
                 "changes of " + std::to_string(lost) + " counters are lost: " + error);
    }
  });
}

std::int32_t HostTallybook::TBDaysSince1970() { return daysSince1970(_clock.now()); }

Date HostTallybook::dateForDaysSince1970(std::int32_t day) { return startOfDay(day); }

void HostTallybook::TBClientCheckpoint() {
  std::string error;
  if (!checkpoint(error)) {
    _log.write(LogLevel::Error, "counters wait for the next checkpoint: " + error);
  }
}

void HostTallybook::TBClientSetValueForScalarKey(std::string_view key, std::int64_t value) {
  std::string error;
  if (!setScalar(key, value, error)) {
    logRefusal(error);
  }
}

void HostTallybook::TBClientAddValueForScalarKey(std::string_view key, std::int64_t value) {
  std::string error;
  if (!addToScalar(key, value, error)) {
    logRefusal(error);
  }
}

void HostTallybook::logRefusal(const std::string& error) {
  _log.write(LogLevel::Error, "a counter is refused: " + error);
}

/// The entry of a counter among those collected, made when it is missing; null, with a text in
/// `error`, when the key is refused.
template <typename Counters>
typename Counters::mapped_type* HostTallybook::pendingCounter(Counters& counters, std::int32_t day,
                                                              std::string_view key,
                                                              std::string& error) {
  const auto found = counters.find(std::pair(day, key));
  if (found != counters.end()) {
    return &found->second;
  }
  return isCounterKey(key, error) ? &counters[{day, std::string(key)}] : nullptr;
}

bool HostTallybook::setScalar(std::string_view key, std::int64_t value, std::string& error) {
  const std::int32_t today = TBDaysSince1970();
  const std::scoped_lock guard(_pendingMutex);
  PendingScalar* const pending = pendingCounter(_pending.scalars, today, key, error);
  if (pending != nullptr) {
    *pending = {true, value};
  }
  return pending != nullptr;
}

bool HostTallybook::addToScalar(std::string_view key, std::int64_t value, std::string& error) {
  const std::int32_t today = TBDaysSince1970();
  const std::scoped_lock guard(_pendingMutex);
  PendingScalar* const pending = pendingCounter(_pending.scalars, today, key, error);
  if (pending != nullptr) {
    pending->value = wrappingSum(pending->value, value);
  }
  return pending != nullptr;
}

bool HostTallybook::addSample(std::string_view key, double value, std::string& error) {
  const Date now = _clock.now();
  const std::int32_t today = daysSince1970(now);
  const auto secondsInDay = static_cast<std::int32_t>(now.seconds - startOfDay(today).seconds);
  const std::scoped_lock guard(_pendingMutex);
  auto* const pending = pendingCounter(_pending.samples, today, key, error);
  if (pending == nullptr) {
    return false;
  }
  const Sample sample{value, secondsInDay};
  if (pending->empty()) {
    pending->emplace_back(1, sample);
  } else {
    pending->back().push_back(sample);
  }
  return true;
}

bool HostTallybook::checkpoint(std::string& error, CounterTrouble* trouble) {
  const std::scoped_lock running(_checkpointMutex);
  Changes changes;
  {
    const std::scoped_lock guard(_pendingMutex);
    std::swap(changes, _pending);
  }
  if (changes.scalars.empty() && changes.samples.empty()) {
    return true;
  }
  const auto apply = [&changes](CounterStore& store) {
    for (const auto& [place, change] : changes.scalars) {
      if (change.isSet) {
        store.setScalar(place.first, place.second, change.value);
      } else {
        store.addToScalar(place.first, place.second, change.value);
      }
    }
    for (const auto& [place, pieces] : changes.samples) {
      for (const std::vector<Sample>& samples : pieces) {
        store.appendSamples(place.first, place.second, samples);
      }
    }
    return true;
  };
  try {
    if (write(apply, error, trouble)) {
      return true;
    }
  } catch (...) {
    keepChanges(changes);
    throw;
  }
  keepChanges(changes);
  return false;
}

/// Merges unwritten changes in front of those collected since. Without allocating: memory may
/// just have run out.
void HostTallybook::keepChanges(Changes& changes) {
  const std::scoped_lock guard(_pendingMutex);
  for (auto& [place, change] : changes.scalars) {
    if (const auto later = _pending.scalars.find(place); later != _pending.scalars.end()) {
      change = later->second.isSet
                   ? later->second
                   : PendingScalar{change.isSet, wrappingSum(change.value, later->second.value)};
    }
  }
  for (auto& [place, pieces] : changes.samples) {
    if (const auto later = _pending.samples.find(place); later != _pending.samples.end()) {
      pieces.splice(pieces.end(), later->second);
    }
  }
  changes.scalars.merge(_pending.scalars);
  changes.samples.merge(_pending.samples);
  std::swap(_pending, changes);
}

std::unique_ptr<TBHistory> HostTallybook::initWithDefaultPath() {
  return std::make_unique<History>(*this);
}

bool HostTallybook::write(const std::function<bool(CounterStore&)>& work, std::string& error,
                          CounterTrouble* trouble) {
  enum Attempt { First, Again, OnNewFile };
  std::optional<CounterFile::Damage> damage;
  for (const Attempt attempt : {First, Again, OnNewFile}) {
    if (attempt == OnNewFile && !recover(*damage, error)) {
      return false;
    }
    damage.reset();
    if (_file.write(work, error, damage, trouble)) {
      return true;
    }
    if (!damage) {
      return false;
    }
  }
  return false;
}

bool HostTallybook::read(const std::function<void(CounterStore&)>& work, std::string& error) {
  std::optional<CounterFile::Damage> damage;
  if (_file.read(work, error, damage)) {
    return true;
  }
  if (damage) {
    recover(*damage, error);
  }
  return false;
}

bool HostTallybook::recover(const CounterFile::Damage& damage, std::string& error) {
  std::string cause;
  const std::optional<std::string> aside = _file.replace(damage, cause);
  if (!aside) {
    error = damage.text + "; it cannot be replaced: " + cause;
    return false;
  }
  if (!aside->empty()) {
    _log.write(LogLevel::Error,
               damage.text + "; kept as " + *aside + ", an empty database takes its place");
    // First forget a count that another process may have changed.
    _preferences.LGSPreferencesSynchronize(kAggregatedDomain);
    const std::int64_t count =
        _preferences.LGSPreferencesGetIntegerValue(kCorruptionCountKey, kAggregatedDomain);
    _preferences.LGSPreferencesSetValue(kCorruptionCountKey, wrappingSum(count, 1),
                                        kAggregatedDomain);
    _preferences.LGSPreferencesSynchronize(kAggregatedDomain);
  }
  return true;
}

}  // namespace vesprun
