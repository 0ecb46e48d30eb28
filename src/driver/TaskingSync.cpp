#include "driver/TaskingSync.h"

#include <algorithm>
#include <cstdint>
#include <functional>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <utility>

#include "common/PropertyDict.h"
#include "common/TextForm.h"
#include "platform/Platform.h"
#include "platform/PreferenceNames.h"

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

/// None when there is no such entry, or no dictionary to hold it.
OptionalValue entryOf(const OptionalValue& holder, std::string_view key) {
  const PropertyDict* dict = holder ? holder->dict() : nullptr;
  const PropertyValue* entry = dict != nullptr ? dict->find(key) : nullptr;
  return entry != nullptr ? OptionalValue(*entry) : std::nullopt;
}

std::optional<std::string_view> textEntry(const PropertyDict& record, std::string_view key) {
  const PropertyValue* entry = record.find(key);
  const std::string* text = entry != nullptr ? entry->string() : nullptr;
  return text != nullptr ? std::optional<std::string_view>(*text) : std::nullopt;
}

void changeMobilePreference(const PropertyDict& record, OptionalValue value, DomainSet& changed) {
  const std::optional<std::string_view> domain = textEntry(record, "Domain");
  platform().preferences().LGSPreferencesSetValue(textEntry(record, "Key"), std::move(value),
                                                  domain.value_or(""));
  if (domain) {
    changed.emplace(*domain);
  }
}

void undoRecord(const PropertyDict& record, DomainSet& changed) {
  const std::string_view user = textEntry(record, "User").value_or("");
  const std::string_view domain = textEntry(record, "Domain").value_or("");
  if (user == kMobileUser) {
    changeMobilePreference(record, std::nullopt, changed);
  } else if (user == kDiagnosticsUser) {
    platform().systemConfiguration().setPrefsKeyValueForDomainWithSync(textEntry(record, "Key"),
                                                                       std::nullopt, domain, false);
  } else {
    platform().servicesClient().deletePreferenceForUserInDomain(textEntry(record, "Key"), user,
                                                                domain);
  }
}

void applyRecord(const PropertyDict& record, DomainSet& changed) {
  const std::string_view user = textEntry(record, "User").value_or("");
  const std::string_view domain = textEntry(record, "Domain").value_or("");
  const PropertyValue* entry = record.find("Value");
  OptionalValue value = entry != nullptr ? OptionalValue(*entry) : std::nullopt;
  if (user == kMobileUser) {
    changeMobilePreference(record, std::move(value), changed);
  } else if (user == kDiagnosticsUser) {
    platform().systemConfiguration().setPrefsKeyValueForDomainWithSync(
        textEntry(record, "Key"), std::move(value), domain, true);
  } else {
    platform().servicesClient().setPreferenceForUserInDomainToValue(textEntry(record, "Key"), user,
                                                                    domain, std::move(value));
  }
}

void forEachRecord(const PropertyValue& payload, DomainSet& changed,
                   void (*handle)(const PropertyDict&, DomainSet&)) {
  const PropertyDict nothing;
  if (const PropertyArray* records = payload.array()) {
    for (const PropertyValue& record : *records) {
      handle(record.dict() != nullptr ? *record.dict() : nothing, changed);
    }
  }
}

void undoStoredTasking(DomainSet& changed) {
  const OptionalValue payload = storedValue(kTaskingPayloadKey);
  if (!payload) {
    return;
  }
  forEachRecord(*payload, changed, undoRecord);
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
  forEachRecord(*payload, changed, applyRecord);
  storeValue(kTaskingIDKey, entryOf(tasking, kTaskingIDKey));
  storeValue(kSystemKey, build);
  storeValue(kTaskingDigestKey, entryOf(tasking, kTaskingDigestKey));
  storeValue(kTaskingPayloadKey, std::move(payload));
  changed.emplace(kOwnDomain);
}

void synchronize(DomainSet changed) {
  const bool own = changed.erase(std::string(kOwnDomain)) != 0;
  for (const std::string& domain : changed) {
    platform().preferences().LGSPreferencesSynchronize(domain);
  }
  if (own) {
    platform().preferences().LGSPreferencesSynchronize(kOwnDomain);
  }
}

void noteOSChange(const OptionalValue& build) {
  const std::int32_t today = platform().tallybook().TBDaysSince1970();
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
  platform().notificationCenter().PostNotification("com.quill.da.tasking_changed");
}

PropertyArray distinctEntries(const PropertyArray& entries) {
  PropertyArray distinct;
  for (const PropertyValue& entry : entries) {
    if (std::find(distinct.begin(), distinct.end(), entry) == distinct.end()) {
      distinct.push_back(entry);
    }
  }
  return distinct;
}

void announceDisabledLogs() {
  const OptionalValue preferred =
      platform().preferences().LGSPreferencesGetValue("disabledLogs", "com.quill.da");
  const PropertyArray* chosen = preferred ? preferred->array() : nullptr;
  const PropertyArray disabled = chosen != nullptr
                                     ? distinctEntries(*chosen)
                                     : platform().systemConfiguration().getLogBlacklist();
  for (const PropertyValue& logType : disabled) {
    platform().eventHub().EventHubSendEventLazy("com.quill.logsmith.disabledLogs", [&logType] {
      return PropertyDict{{"bugType", logType}};
    });
  }
}

}  // namespace

void syncTaskingAndOSChange() {
  const PropertyDict version = platform().logsmith().CopySystemVersionDictionary();
  const OptionalValue build = entryOf(version, "ProductBuildVersion");
  noteOSChange(build);
  syncTasking(build);
  announceDisabledLogs();
}

}  // namespace vesprun
