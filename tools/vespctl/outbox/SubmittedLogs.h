#pragma once

#include <functional>
#include <span>
#include <string>
#include <vector>

#include "platform/host/outbox/DailyLogs.h"

namespace vesprun {

using SubmittedLog = DailyLog;

/// The names in the folder of submitted logs. Throws `CommandFailure` when it cannot be read.
std::vector<std::string> namesOfLogs(const DeviceDirectory& directory);

/// As `forEachDailyLog`; throws `CommandFailure` when the outbox cannot be read.
std::vector<UnreadableLog> forEachSubmittedLog(const DeviceDirectory& directory,
                                               const std::function<void(SubmittedLog&& log)>& take);

/// Names unreadable logs on standard error.
void nameUnreadable(std::span<const UnreadableLog> logs);

}  // namespace vesprun
