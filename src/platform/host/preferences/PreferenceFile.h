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

/// The preferences of one domain: a ptree document DOMAIN.ptree whose root is a dictionary, and the
/// changes that are not in it yet. The document is read when it is first needed.
///
/// A document that cannot be made sense of counts as empty. It is left as it is until there is
/// something to write, and is then kept beside the new one, as DOMAIN.ptree.unreadable-TIME. A file
/// that cannot be read at all is never written over. Both are told in the system log.
class PreferenceFile {
 public:
  /// `folder` is a path of the device; it is made with the first document. While another process
  /// keeps it locked, a change waits for `longestWait` at most.
  PreferenceFile(const DeviceDirectory& device, Clock& clock, SystemLog& log, std::string folder,
                 std::string_view domain, std::chrono::milliseconds longestWait);

  std::optional<PropertyValue> get(std::string_view key);

  /// Every value, changes included.
  PropertyDict values();

  /// Sets a value, or removes the key when there is none. A value that no document could carry is
  /// refused in the system log, so that it cannot hold up the other changes.
  void set(std::string_view key, std::optional<PropertyValue> value);

  /// Makes the changes to the document as it is now, whoever wrote it, and writes it durably if
  /// that makes a difference. False, with an error in the system log, when that failed; the changes
  /// then stay for the next attempt. What was read is read anew afterwards.
  bool synchronize();

 private:
  enum class State { Missing, Good, Malformed, Unreadable };
  struct Content {
    State state = State::Missing;
    PropertyDict values;
    std::string error;  ///< for the last two states: names the file, and the line or the cause
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
  std::string _reported;  ///< the last complaint about the document, which is made once
};

}  // namespace vesprun
