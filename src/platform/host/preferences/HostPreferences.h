#pragma once

#include <chrono>
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
#include "platform/host/files/Files.h"

namespace vesprun {

/// A device folder with a ptree document for each domain.
struct PreferenceFolder {
  std::string path;
};

/// Preferences as ptree documents in a device folder, DOMAIN.ptree with a dictionary as its root
/// for each domain. A document is read when it is first needed. Safe from any thread.
///
/// A malformed document counts as empty. When there is something to write, it is kept as
/// DOMAIN.ptree.unreadable-TIME. A file that cannot be read is never overwritten. Both are errors
/// in the system log, and so is a value that no document can carry, which is refused.
///
/// Users and domains become parts of paths: empty names and names with a leading dot, a slash or
/// NUL are refused with an error in the system log (once for a domain) and read as empty.
class HostPreferences : public Preferences {
 public:
  /// The preferences of a user in var/USER/Library/Preferences. The references must outlive the
  /// object; the log is written from several threads. `LGSPreferencesSynchronize` waits
  /// `longestWait` at most for another process's change in the folder.
  HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                  std::string_view user = "mobile",
                  std::chrono::milliseconds longestWait = kMaxLockWait);

  /// Those in another folder, such as Library/Logsmith.
  HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                  PreferenceFolder folder);

  /// Synchronizes every domain.
  ~HostPreferences() override;

  std::optional<PropertyValue> LGSPreferencesGetValue(std::string_view key,
                                                      std::string_view domain) override;
  void LGSPreferencesSetValue(std::optional<std::string_view> key,
                              std::optional<PropertyValue> value, std::string_view domain) override;
  /// Applies the changes to the current document, whoever wrote it, and writes it if that makes a
  /// difference. Afterwards the document is read anew.
  bool LGSPreferencesSynchronize(std::string_view domain) override;

  /// With the changes.
  PropertyDict valuesOfDomain(std::string_view domain);

 private:
  struct Content {
    PropertyDict values;
    std::string error;  ///< of a document that cannot be used: file, and line or cause
    bool isMalformed = false;
  };
  struct Domain {
    HostPath path;  ///< of the document, on the host
    std::optional<PropertyDict> stored{};
    std::map<std::string, std::optional<PropertyValue>> changes{};
    std::string reported{};  ///< the last complaint, made once

    Content read() const;
    void applyChanges(PropertyDict& values) const;
  };

  /// Null for a refused name.
  Domain* find(std::string_view domain);
  const PropertyDict& stored(Domain& domain);
  bool synchronize(Domain& domain);
  bool writeChanges(const Domain& domain, std::string& error);
  bool keepAside(const HostPath& path, int folder, std::string& error);

  const DeviceDirectory& _device;
  Clock& _clock;
  SystemLog& _log;
  std::string _folder;  ///< empty for a refused user
  std::chrono::milliseconds _longestWait = kMaxLockWait;
  std::mutex _mutex;
  std::map<std::string, Domain, std::less<>> _domains;
  std::set<std::string, std::less<>> _refused;  ///< domains
};

}  // namespace vesprun
