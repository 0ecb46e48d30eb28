#include "platform/host/services/HostLogsmith.h"

#include "platform/host/device/LiveSystem.h"

namespace vesprun {

bool HostLogsmith::LGSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                            const PropertyDict* header, const LogWriter& writer) {
  return !_description.submission.fails && _outbox.submitLog(logType, logName, header, writer);
}

std::string HostLogsmith::LGSOSVersion() {
  const auto& described = _description.system.osVersion;
  return described ? *described : live::osVersion();
}

PropertyDict HostLogsmith::CopySystemVersionDictionary() {
  const auto& described = _description.system.buildVersion;
  return {{"ProductBuildVersion", described ? *described : live::osBuild()}};
}

bool HostLogsmith::FLLogStructuredData(std::int32_t type, const PropertyDict& record) {
  return _outbox.append("records.jsonl", {{"type", type}, {"record", record}});
}

}  // namespace vesprun
