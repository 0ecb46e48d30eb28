#include "platform/host/preferences/HostPreferences.h"

#include <utility>

#include "platform/Guarded.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

bool isPartOfPath(std::string_view name) {
  return !name.empty() && name.front() != '.' && name.find('/') == std::string_view::npos &&
         name.find('\0') == std::string_view::npos;
}

}  // namespace

HostPreferences::HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                                 std::string_view user, std::chrono::milliseconds longestWait)
    : _device(device), _clock(clock), _log(log), _longestWait(longestWait) {
  if (isPartOfPath(user)) {
    _folder = "var/" + std::string(user) + "/Library/Preferences";
  } else {
    _log.write(LogLevel::Error, quotedText(user) + " cannot be the name of a user");
  }
}

HostPreferences::HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                                 PreferenceFolder folder)
    : _device(device), _clock(clock), _log(log), _folder(std::move(folder.path)) {}

HostPreferences::~HostPreferences() {
  for (auto& [domain, file] : _files) {
    runGuarded(_log, "preferences", [&changed = file] { changed.synchronize(); });
  }
}

PreferenceFile* HostPreferences::file(std::string_view domain) {
  if (const auto known = _files.find(domain); known != _files.end()) {
    return &known->second;
  }
  if (_folder.empty()) {
    return nullptr;
  }
  if (!isPartOfPath(domain)) {
    if (_refused.emplace(domain).second) {
      _log.write(LogLevel::Error, quotedText(domain) + " cannot be the name of a domain");
    }
    return nullptr;
  }
  const auto added =
      _files.try_emplace(std::string(domain), _device, _clock, _log, _folder, domain, _longestWait);
  return &added.first->second;
}

std::optional<PropertyValue> HostPreferences::LGSPreferencesGetValue(std::string_view key,
                                                                     std::string_view domain) {
  const std::scoped_lock guard(_mutex);
  PreferenceFile* preferences = file(domain);
  return preferences != nullptr ? preferences->get(key) : std::nullopt;
}

void HostPreferences::LGSPreferencesSetValue(std::optional<std::string_view> key,
                                             std::optional<PropertyValue> value,
                                             std::string_view domain) {
  const std::scoped_lock guard(_mutex);
  PreferenceFile* preferences = file(domain);
  if (preferences == nullptr) {
    return;
  }
  if (!key) {
    _log.write(LogLevel::Error, "no key to change in domain " + quotedText(domain));
    return;
  }
  preferences->set(*key, std::move(value));
}

bool HostPreferences::LGSPreferencesSynchronize(std::string_view domain) {
  const std::scoped_lock guard(_mutex);
  PreferenceFile* preferences = file(domain);
  return preferences != nullptr && preferences->synchronize();
}

PropertyDict HostPreferences::valuesOfDomain(std::string_view domain) {
  const std::scoped_lock guard(_mutex);
  PreferenceFile* preferences = file(domain);
  return preferences != nullptr ? preferences->values() : PropertyDict{};
}

}  // namespace vesprun
