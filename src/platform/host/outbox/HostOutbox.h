#pragma once

#include <map>
#include <mutex>
#include <string>
#include <string_view>

#include "platform/Clock.h"
#include "platform/EventHub.h"
#include "platform/Logsmith.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/JsonLines.h"

namespace vesprun {

/// The folder `outbox`: everything that the program gives to the platform, until someone collects
/// it. Failures go to the system log. Safe from any thread.
class HostOutbox : public EventHub, public Logsmith {
 public:
  HostOutbox(const DeviceDirectory& directory, const DeviceDescription& description, Clock& clock,
             SystemLog& log)
      : _directory(directory), _description(description), _clock(clock), _log(log) {}

  bool sendEventLazyIsAvailable() override { return _description.events.available; }
  bool EventHubIsEventUsed(std::string_view event) override;
  /// Adds to `events.jsonl`, and the next ones to `notifications.jsonl` and `records.jsonl`.
  bool EventHubSendEventLazy(std::string_view event, const PayloadBuilder& build) override;
  void PostNotification(std::string_view name) override;
  bool FLLogStructuredData(std::int32_t type, const PropertyDict& record) override;

  bool DiagnosticLogSubmissionEnabled() override { return _description.submission.enabled; }
  /// Submits a log as `logs/NNNN-TYPE-NAME.EXTENSION`, numbered from 0001, and its header, if any.
  /// The log appears last and complete, or not at all: false. No existing file is touched. The
  /// files' modification time is the device's.
  bool LGSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                const PropertyDict* header, const LogWriter& writer) override;
  std::string LGSOSVersion() override;
  PropertyDict CopySystemVersionDictionary() override;
  void FLDumpAllOldStructuredDataLogs() override {}
  void rollTendmarkLogs() override {}

 private:
  bool append(std::string_view file, const PropertyDict& entries);
  void noteSubmitted(const std::string& name, const Date& time) const;
  bool writeLog(std::string_view type, std::string_view name, const PropertyDict* header,
                const LogWriter& writer, std::string& error) const;

  const DeviceDirectory& _directory;
  const DeviceDescription& _description;
  Clock& _clock;
  SystemLog& _log;
  std::mutex _mutex;
  std::map<std::string_view, JsonLines> _files;  ///< by constants
};

}  // namespace vesprun
