#include "platform/host/counters/HostTallybook.h"

#include <optional>

#include "common/Calendar.h"
#include "platform/PreferenceNames.h"

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
    if (!flush(error)) {
      _log.write(LogLevel::Error,
                 "changes of " + std::to_string(_pending.size()) + " counters are lost: " + error);
    }
  });
}

std::int32_t HostTallybook::TBDaysSince1970() { return daysSince1970(_clock.now()); }

Date HostTallybook::dateForDaysSince1970(std::int32_t day) { return startOfDay(day); }

void HostTallybook::TBClientCheckpoint() {
  std::string error;
  if (!flush(error)) {
    _log.write(LogLevel::Error, "counters wait for the next checkpoint: " + error);
  }
}

void HostTallybook::TBClientSetValueForScalarKey(std::string_view key, std::int64_t value) {
  collect(key, {true, value});
}

void HostTallybook::TBClientAddValueForScalarKey(std::string_view key, std::int64_t value) {
  collect(key, {false, value});
}

void HostTallybook::collect(std::string_view key, PendingScalar change) {
  std::string error;
  if (!isCounterKey(key, error)) {
    _log.write(LogLevel::Error, "a counter is refused: " + error);
    return;
  }
  const std::int32_t today = TBDaysSince1970();
  const std::scoped_lock guard(_pendingMutex);
  const auto [entry, isNew] = _pending.try_emplace({today, std::string(key)}, change);
  if (isNew) {
    return;
  }
  if (change.isSet) {
    entry->second = change;
  } else {
    entry->second.value = wrappingSum(entry->second.value, change.value);
  }
}

bool HostTallybook::flush(std::string& error) {
  const std::scoped_lock flushing(_flushMutex);
  PendingScalars changes;
  {
    const std::scoped_lock guard(_pendingMutex);
    changes.swap(_pending);
  }
  if (changes.empty()) {
    return true;
  }
  const auto apply = [&changes](CounterStore& store) {
    for (const auto& [place, change] : changes) {
      if (change.isSet) {
        store.setScalar(place.first, place.second, change.value);
      } else {
        store.addToScalar(place.first, place.second, change.value);
      }
    }
    return true;
  };
  // Without allocating: memory may just have run out.
  const auto keepChanges = [&] {
    const std::scoped_lock guard(_pendingMutex);
    for (auto& [place, change] : changes) {
      if (const auto later = _pending.find(place); later != _pending.end()) {
        change = later->second.isSet
                     ? later->second
                     : PendingScalar{change.isSet, wrappingSum(change.value, later->second.value)};
      }
    }
    changes.merge(_pending);
    _pending.swap(changes);
  };
  try {
    if (write(apply, error)) {
      return true;
    }
  } catch (...) {
    keepChanges();
    throw;
  }
  keepChanges();
  return false;
}

std::unique_ptr<TBHistory> HostTallybook::initWithDefaultPath() {
  return std::make_unique<History>(*this);
}

bool HostTallybook::write(const std::function<bool(CounterStore&)>& work, std::string& error) {
  std::optional<CounterFile::Damage> damage;
  if (_file.write(work, error, damage)) {
    return true;
  }
  if (!damage || !recover(*damage, error)) {
    return false;
  }
  return _file.write(work, error, damage);
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
    // The first synchronization lets go of a count that another process may have changed.
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
