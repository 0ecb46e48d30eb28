#include "driver/TaskingSync.h"

#include <array>
#include <cstdint>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <unordered_set>
#include <utility>

#include "common/KeyHash.h"
#include "common/TextForm.h"
#include "platform/Platform.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {
namespace {

constexpr std::string_view kLastUpdateKey = "LastOSUpdate";
constexpr std::string_view kSystemKey = "TaskingOS";

constexpr std::string_view kMobileUser = "mobile";
constexpr std::string_view kDiagnosticsUser = "__logsmith__";

using OptionalValue = std::optional<PropertyValue>;
using DomainSet = std::set<std::string, std::less<>>;

OptionalValue storedValue(std::string_view key) {
  return platform().preferences().LGSPreferencesGetValue(key, kOwnDomain);
}

void storeValue(std::string_view key, OptionalValue value) {
  platform().preferences().LGSPreferencesSetValue(key, std::move(value), kOwnDomain);
}

/// Nothing without a dictionary or the entry.
OptionalValue entryOf(const OptionalValue& holder, std::string_view key) {
  const PropertyDict* dict = holder ? holder->dict() : nullptr;
  const PropertyValue* entry = dict != nullptr ? dict->find(key) : nullptr;
  return entry != nullptr ? OptionalValue(*entry) : std::nullopt;
}

std::optional<std::string_view> textEntry(const PropertyDict& record, std::string_view key) {
  const std::string* text = record.findString(key);
  return text != nullptr ? std::optional<std::string_view>(*text) : std::nullopt;
}

/// A setting of a payload; entries of a wrong type count as missing.
struct TaskingRecord {
  explicit TaskingRecord(const PropertyValue& element) {
    if (const PropertyDict* record = element.dict()) {
      user = textEntry(*record, "User").value_or("");
      domain = textEntry(*record, "Domain").value_or("");
      key = textEntry(*record, "Key");
      value = record->find("Value");
    }
  }

  std::string_view user;
  std::string_view domain;
  std::optional<std::string_view> key;
  const PropertyValue* value = nullptr;
};

enum class Change { Apply, Undo };

void changePreference(const TaskingRecord& record, Change change, DomainSet& changed) {
  const bool applies = change == Change::Apply;
  OptionalValue value;
  if (applies && record.value != nullptr) {
    value = *record.value;
  }
  if (record.user == kMobileUser) {
    platform().preferences().LGSPreferencesSetValue(record.key, std::move(value), record.domain);
    changed.emplace(record.domain);
  } else if (record.user == kDiagnosticsUser) {
    platform().systemConfiguration().setPrefsKeyValueForDomainWithSync(record.key, std::move(value),
                                                                       record.domain, applies);
  } else if (applies) {
    platform().servicesClient().setPreferenceForUserInDomainToValue(
        record.key, record.user, record.domain, std::move(value));
  } else {
    platform().servicesClient().deletePreferenceForUserInDomain(record.key, record.user,
                                                                record.domain);
  }
}

void changePreferences(const PropertyValue& payload, Change change, DomainSet& changed) {
  if (const PropertyArray* records = payload.array()) {
    for (const PropertyValue& record : *records) {
      changePreference(TaskingRecord(record), change, changed);
    }
  }
}

void undoStoredTasking(DomainSet& changed) {
  const OptionalValue payload = storedValue(kTaskingPayloadKey);
  if (!payload) {
    return;
  }
  changePreferences(*payload, Change::Undo, changed);
  for (const std::string_view key : {kTaskingIDKey, kTaskingDigestKey, kTaskingPayloadKey}) {
    storeValue(key, std::nullopt);
  }
  changed.emplace(kOwnDomain);
}

void applyTasking(const OptionalValue& tasking, const OptionalValue& build, DomainSet& changed) {
  OptionalValue payload = entryOf(tasking, kTaskingPayloadKey);
  if (!payload) {
    return;
  }
  changePreferences(*payload, Change::Apply, changed);
  storeValue(kTaskingIDKey, entryOf(tasking, kTaskingIDKey));
  storeValue(kSystemKey, build);
  storeValue(kTaskingDigestKey, entryOf(tasking, kTaskingDigestKey));
  storeValue(kTaskingPayloadKey, std::move(payload));
  changed.emplace(kOwnDomain);
}

/// Our own domain last: it records what was applied.
void synchronize(DomainSet changed) {
  platform().systemConfiguration().synchronize();
  platform().servicesClient().synchronizeAllUsers();
  const bool own = changed.erase(std::string(kOwnDomain)) != 0;
  for (const std::string& domain : changed) {
    platform().preferences().LGSPreferencesSynchronize(domain);
  }
  if (own) {
    platform().preferences().LGSPreferencesSynchronize(kOwnDomain);
  }
}

void noteOSChange(const OptionalValue& build, std::int32_t today) {
  const OptionalValue lastBuild = entryOf(storedValue(kLastUpdateKey), "version");
  if (!build || build == lastBuild) {
    return;
  }
  logMessage(LogLevel::Default, "OS change since last run (%s -> %s)",
             textFormOrNull(lastBuild).c_str(), textFormOrNull(build).c_str());
  storeValue(kLastUpdateKey, PropertyDict{{"version", *build}, {"day", today}});
}

void syncTasking(const OptionalValue& build) {
  const OptionalValue scheduled = platform().systemConfiguration().getPrefsKeyForDomainWithOptions(
      "ScheduledTasking", "com.quill.Ferrywell", 0);
  const OptionalValue identifier = entryOf(scheduled, kTaskingIDKey);
  if (!identifier) {
    return;
  }
  const OptionalValue storedIdentifier = storedValue(kTaskingIDKey);
  const OptionalValue storedBuild = storedValue(kSystemKey);
  DomainSet changed;
  if (storedIdentifier) {
    if (storedIdentifier == identifier && storedBuild == build) {
      return;
    }
    logMessage(LogLevel::Default, "Tasking update (%s -> %s, %s -> %s)",
               textForm(*storedIdentifier).c_str(), textForm(*identifier).c_str(),
               textFormOrNull(storedBuild).c_str(), textFormOrNull(build).c_str());
    undoStoredTasking(changed);
  }
  applyTasking(scheduled, build, changed);
  synchronize(std::move(changed));
  platform().eventHub().PostNotification("com.quill.da.tasking_changed");
}

/// Equal for equal values (-0.0 and 0 too, whatever the kinds of numbers and the order of a
/// dictionary's entries), and seldom for others.
std::size_t hashOf(const PropertyValue& value) {
  const auto hashOfBytes = [](const auto& object) {
    return KeyHash()({reinterpret_cast<const char*>(&object), sizeof object});
  };
  if (const Number* number = value.number()) {
    return hashOfBytes(number->asDouble() + 0.0);
  }
  std::size_t hash = 0;
  if (const PropertyArray* array = value.array()) {
    for (const PropertyValue& element : *array) {
      hash = hashOfBytes(std::array{hash, hashOf(element)});
    }
  } else if (const PropertyDict* dict = value.dict()) {
    for (const auto& [key, entry] : *dict) {
      hash += hashOfBytes(std::array{KeyHash()(key), hashOf(entry)});
    }
  } else {
    hash = KeyHash()(textForm(value));
  }
  return hash;
}

PropertyArray distinctEntries(const PropertyArray& entries) {
  struct Hash {
    std::size_t operator()(const PropertyValue* value) const { return hashOf(*value); }
  };
  struct Equal {
    bool operator()(const PropertyValue* left, const PropertyValue* right) const {
      return *left == *right;
    }
  };
  std::unordered_set<const PropertyValue*, Hash, Equal> seen;
  PropertyArray distinct;
  for (const PropertyValue& entry : entries) {
    if (seen.insert(&entry).second) {
      distinct.push_back(entry);
    }
  }
  return distinct;
}

void announceDisabledLogs() {
  PropertyArray disabled = platform().systemConfiguration().getLogBlacklist();
  const OptionalValue preferred =
      platform().preferences().LGSPreferencesGetValue("disabledLogs", "com.quill.da");
  if (preferred && preferred->array() != nullptr) {
    disabled = distinctEntries(*preferred->array());
  }
  for (const PropertyValue& logType : disabled) {
    platform().eventHub().EventHubSendEventLazy("com.quill.logsmith.disabledLogs", [&logType] {
      return PropertyDict{{"bugType", logType}};
    });
  }
}

}  // namespace

void syncTaskingAndOSChange() {
  const std::int32_t today = platform().tallybook().TBDaysSince1970();
  const PropertyDict version = platform().logsmith().CopySystemVersionDictionary();
  const OptionalValue build = entryOf(version, "ProductBuildVersion");
  noteOSChange(build, today);
  syncTasking(build);
  announceDisabledLogs();
}

}  // namespace vesprun
