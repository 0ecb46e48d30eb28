#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/host/device/DeviceDirectory.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// A submitted daily log in the outbox.
struct DailyLog {
  std::string name;           ///< of its file
  std::int32_t day = 0;       ///< that it reports
  std::int64_t revision = 0;  ///< of that day, from 1
  bool isNoted = false;       ///< as removed, by a command that was killed before the removal
  PropertyDict document;
};

/// A file with the name of a daily log that is not one.
struct UnreadableLog {
  std::string name;
  std::string why;
  bool wasRead;  ///< and so will never be one; else it may be read another time
};

/// True for the names that daily logs have.
bool isDailyLogName(std::string_view name);

/// Calls `take` with the daily logs in the outbox, by number. A log's revision is one more than the
/// highest of its day so far, pruned logs included. Gives the files that are not daily logs;
/// nothing, with a text in `error`, when the outbox cannot be read.
std::optional<std::vector<UnreadableLog>> forEachDailyLog(
    const DeviceDirectory& directory, const std::function<void(DailyLog&& log)>& take,
    std::string& error);

}  // namespace vesprun
