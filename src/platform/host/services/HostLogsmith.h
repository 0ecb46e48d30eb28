#pragma once

#include "platform/Logsmith.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/Outbox.h"

namespace vesprun {

/// The diagnostics services. Submitted logs and records lie in the outbox until whoever runs the
/// device collects them, so the housekeeping of old logs finds nothing to do here.
class HostLogsmith : public Logsmith {
 public:
  HostLogsmith(const DeviceDescription& description, Outbox& outbox)
      : _description(description), _outbox(outbox) {}

  bool DiagnosticLogSubmissionEnabled() override { return _description.submission.enabled; }
  bool LGSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                const PropertyDict* header, const LogWriter& writer) override;
  std::string LGSOSVersion() override;
  PropertyDict CopySystemVersionDictionary() override;
  bool FLLogStructuredData(std::int32_t type, const PropertyDict& record) override;
  void FLDumpAllOldStructuredDataLogs() override {}
  void rollTendmarkLogs() override {}

 private:
  const DeviceDescription& _description;
  Outbox& _outbox;
};

}  // namespace vesprun
