#pragma once

#include <chrono>
#include <map>
#include <optional>
#include <string>
#include <string_view>

#include "common/PropertyDict.h"
#include "platform/Clock.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// The preferences of one domain: the ptree document DOMAIN.ptree, whose root is a dictionary, and
/// unwritten changes. The document is read when it is first needed.
///
/// A malformed document counts as empty. It stays until there is something to write, and is then
/// kept as DOMAIN.ptree.unreadable-TIME. A file that cannot be read is never overwritten. Both are
/// errors in the system log.
class PreferenceFile {
 public:
  /// `folder` is a device path, created with the first document. A change waits `longestWait` at
  /// most for another process's lock.
  PreferenceFile(const DeviceDirectory& device, Clock& clock, SystemLog& log, std::string folder,
                 std::string_view domain, std::chrono::milliseconds longestWait);

  std::optional<PropertyValue> get(std::string_view key);

  /// With the changes.
  PropertyDict values();

  /// Sets a value, or removes the key when there is none. A value that no document can carry is
  /// refused in the system log, so that it cannot hold up other changes.
  void set(std::string_view key, std::optional<PropertyValue> value);

  /// Applies the changes to the current document, whoever wrote it, and writes it durably if that
  /// makes a difference. False, with an error in the system log, on failure: the changes stay for
  /// the next attempt. Afterwards the document is read anew.
  bool synchronize();

 private:
  enum class State { Missing, Good, Malformed, Unreadable };
  struct Content {
    State state = State::Missing;
    PropertyDict values;
    std::string error;  ///< for the last two states: file, and line or cause
  };

  Content read() const;
  const PropertyDict& stored();
  bool writeChanges(std::string& error);
  bool keepAside(std::string& error) const;
  void applyChanges(PropertyDict& values) const;

  const DeviceDirectory& _device;
  Clock& _clock;
  SystemLog& _log;
  std::string _folder;
  std::string _path;  ///< of the document, on the host
  std::chrono::milliseconds _longestWait;
  std::optional<PropertyDict> _stored;
  std::map<std::string, std::optional<PropertyValue>> _changes;
  std::string _reported;  ///< the last complaint, made once
};

}  // namespace vesprun
