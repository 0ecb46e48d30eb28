#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

inline constexpr std::string_view kPrunedLogsFile = "outbox/pruned.jsonl";

/// A daily log that was removed from the outbox.
struct PrunedLog {
  std::string name;
  std::uint64_t number = 0;   ///< that the name begins with; 0 when it begins with none
  std::int32_t day = 0;       ///< that the log reported
  std::int64_t revision = 0;  ///< of that day, from 1
};
using PrunedLogs = std::vector<PrunedLog>;

/// The notes in `outbox/pruned.jsonl`; lines of another form are passed over. Nothing, with a text
/// in `error`, when the file is there and cannot be read.
std::optional<PrunedLogs> readPrunedLogs(const DeviceDirectory& directory, std::string& error);

}  // namespace vesprun
