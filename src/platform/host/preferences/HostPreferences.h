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

/// A folder of the device that holds one ptree document for each domain.
struct PreferenceFolder {
  std::string path;
};

/// Preferences kept as ptree documents, one for each domain, in one folder of the device; see
/// `PreferenceFile` for what becomes of a document that cannot be read. May be called from any
/// thread.
///
/// The names of users and domains are parts of paths: an empty one, one that begins with a dot and
/// one with a slash or NUL in it are refused with an error in the system log. There is then no
/// value, and nothing can be written. A refused domain is told once.
class HostPreferences final : public Preferences {
 public:
  /// The preferences of a user: var/USER/Library/Preferences. What the references name must outlive
  /// the object; the log must stand being written to by several threads. While another process
  /// changes something in the folder, `LGSPreferencesSynchronize` waits for `longestWait` at most.
  HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                  std::string_view user = "mobile",
                  std::chrono::milliseconds longestWait = kLongestLockWait);

  /// Those of another folder, such as Library/Logsmith.
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
  /// When nothing changed, nothing is written; what was read is let go, so that the next look-up
  /// sees what others wrote.
  bool LGSPreferencesSynchronize(std::string_view domain) override;

  /// Every value of a domain.
  PropertyDict valuesOfDomain(std::string_view domain);

 private:
  PreferenceFile* file(std::string_view domain);

  const DeviceDirectory& _device;
  Clock& _clock;
  SystemLog& _log;
  std::string _folder;  ///< empty when the user's name was refused
  std::chrono::milliseconds _longestWait = kLongestLockWait;
  std::mutex _mutex;
  std::map<std::string, PreferenceFile, std::less<>> _files;
  std::set<std::string, std::less<>> _refused;  ///< domains
};

}  // namespace vesprun
