#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "common/PropertyDict.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// A submitted daily log in the outbox.
struct SubmittedLog {
  std::string name;       ///< of its file
  std::int32_t day = 0;   ///< that it reports
  std::int64_t revision;  ///< of that day, from 1
  PropertyDict document;
};

/// A file with the name of a daily log that is not one.
struct UnreadableLog {
  std::string name;
  std::string why;
};

struct SubmittedLogs {
  std::vector<SubmittedLog> logs;  ///< by number
  std::vector<UnreadableLog> unreadable;
};

/// The daily logs in the outbox. A log's revision is one more than the highest of its day so far,
/// pruned logs included. Throws `CommandFailure` when the outbox cannot be read.
SubmittedLogs readSubmittedLogs(const DeviceDirectory& directory);

}  // namespace vesprun
