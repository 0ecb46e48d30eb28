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

/// The folder `outbox`: everything that the program gives to the platform. Failures go to the
/// system log.
class Outbox {
 public:
  Outbox(const DeviceDirectory& directory, Clock& clock, SystemLog& log)
      : _directory(directory), _clock(clock), _log(log) {}

  /// Appends the time and the entries as one line. False when it could not be written. Safe from
  /// any thread.
  bool append(const std::string& file, const PropertyDict& entries);

  /// Submits a log as `logs/NNNN-TYPE-NAME.EXTENSION`, numbered from 0001, and its header, if any.
  /// The log appears last and complete, or not at all: false. No existing file is touched. The
  /// files' modification time is the device's.
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
