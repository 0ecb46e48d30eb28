#pragma once

#include "platform/Clock.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/JsonLines.h"

namespace vesprun {

/// `outbox/log.jsonl`; standard error gets what cannot be written there. Safe from any thread.
class HostSystemLog : public SystemLog {
 public:
  HostSystemLog(const DeviceDirectory& directory, Clock& clock, LogLevel lowestKept)
      : _directory(directory), _clock(clock), _lowestKept(lowestKept) {}

  bool keeps(LogLevel level) const override { return level <= _lowestKept; }
  void write(LogLevel level, std::string_view message) override;

 private:
  const DeviceDirectory& _directory;
  Clock& _clock;
  LogLevel _lowestKept;
  JsonLines _lines{_directory.hostPath("outbox/log.jsonl")};
};

}  // namespace vesprun
