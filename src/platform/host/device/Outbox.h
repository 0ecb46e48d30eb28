#pragma once

#include <map>
#include <mutex>
#include <string>
#include <string_view>

#include "common/PropertyDict.h"
#include "platform/Clock.h"
#include "platform/Logsmith.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/JsonLines.h"

namespace vesprun {

/// What the program hands to the platform: the folder `outbox`. Failures are told in the system
/// log.
class Outbox {
 public:
  Outbox(const DeviceDirectory& directory, Clock& clock, SystemLog& log)
      : _directory(directory), _clock(clock), _log(log) {}

  /// Appends one line to a file of lines: the time, then the entries. May be called from any
  /// thread. False when the line could not be written.
  bool append(const std::string& file, const PropertyDict& entries);

  /// Submits a log as `logs/NNNN-TYPE-NAME.EXTENSION`, numbered upwards from 0001, with its header,
  /// when there is one, beside it. The log appears last and complete, or not at all: false. No
  /// file that is there already is touched. The files' modification time is that of the device.
  bool submitLog(std::string_view type, std::string_view name, const PropertyDict* header,
                 const Logsmith::LogWriter& writer);

 private:
  bool writeLog(std::string_view type, std::string_view name, const PropertyDict* header,
                const Logsmith::LogWriter& writer, std::string& error) const;

  const DeviceDirectory& _directory;
  Clock& _clock;
  SystemLog& _log;
  std::mutex _mutex;
  std::map<std::string, JsonLines> _files;
};

}  // namespace vesprun
