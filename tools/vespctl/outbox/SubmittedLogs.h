#pragma once

#include <functional>
#include <span>
#include <string>
#include <vector>

#include "platform/host/HostPlatform.h"
#include "platform/host/outbox/DailyLogs.h"

namespace vesprun {

using SubmittedLog = DailyLog;

/// The names in the folder of submitted logs. Throws `CommandFailure` when it cannot be read.
std::vector<std::string> namesOfLogs(const DeviceDirectory& directory);

/// As `forEachDailyLog`; throws `CommandFailure` when the outbox cannot be read.
std::vector<UnreadableLog> forEachSubmittedLog(const DeviceDirectory& directory,
                                               const std::function<void(SubmittedLog&& log)>& take);

/// The name under which a device's logs are exported unless the command line gives one: a
/// pseudonym that stays the same.
std::string exportedName(const HostPlatform& device);

/// Names unreadable logs on standard error.
void nameUnreadable(std::span<const UnreadableLog> logs);
/// The same; throws `CommandFailure` with the last one.
void failIfUnreadable(std::span<const UnreadableLog> logs);

}  // namespace vesprun
