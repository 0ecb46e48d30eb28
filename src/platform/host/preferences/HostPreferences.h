#pragma once

#include <chrono>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <string_view>

#include "platform/Clock.h"
#include "platform/Preferences.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/FileLock.h"
#include "platform/host/preferences/PreferenceFile.h"

namespace vesprun {

/// A device folder with a ptree document for each domain.
struct PreferenceFolder {
  std::string path;
};

/// Preferences as ptree documents, one for each domain, in a device folder; `PreferenceFile`
/// handles those that cannot be read. Safe from any thread.
///
/// Users and domains become parts of paths: empty names and names with a leading dot, a slash or
/// NUL are refused with an error in the system log (once for a domain), read as empty and never
/// written.
class HostPreferences final : public Preferences {
 public:
  /// The preferences of a user in var/USER/Library/Preferences. The references must outlive the
  /// object; the log is written from several threads. `LGSPreferencesSynchronize` waits
  /// `longestWait` at most for another process's change in the folder.
  HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                  std::string_view user = "mobile",
                  std::chrono::milliseconds longestWait = kLongestLockWait);

  /// Those in another folder, such as Library/Logsmith.
  HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                  PreferenceFolder folder);

  /// Synchronizes every domain.
  ~HostPreferences() override;

  HostPreferences(const HostPreferences&) = delete;
  HostPreferences& operator=(const HostPreferences&) = delete;

  std::optional<PropertyValue> LGSPreferencesGetValue(std::string_view key,
                                                      std::string_view domain) override;
  void LGSPreferencesSetValue(std::optional<std::string_view> key,
                              std::optional<PropertyValue> value, std::string_view domain) override;
  /// Writes only changes, and forgets what was read, so that the next look-up sees what others
  /// wrote.
  bool LGSPreferencesSynchronize(std::string_view domain) override;

  PropertyDict valuesOfDomain(std::string_view domain);

 private:
  PreferenceFile* file(std::string_view domain);

  const DeviceDirectory& _device;
  Clock& _clock;
  SystemLog& _log;
  std::string _folder;  ///< empty for a refused user
  std::chrono::milliseconds _longestWait = kLongestLockWait;
  std::mutex _mutex;
  std::map<std::string, PreferenceFile, std::less<>> _files;
  std::set<std::string, std::less<>> _refused;  ///< domains
};

}  // namespace vesprun
