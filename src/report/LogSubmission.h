#pragma once

#include <optional>
#include <string>

#include "common/PropertyDict.h"

namespace vesprun {

/// Logged, at error level, when the diagnostics service does not take the log.
inline constexpr const char* kSubmissionFailed = "Failed to write aggregated log";

/// The bytes of a daily log; nothing, with an error line, when no document can carry it.
std::optional<std::string> serializeDailyLog(const PropertyDict& document);

/// Submits the bytes as log "log-aggregated" of type "193". The header names the previous OS
/// version on the first log after it changed. False, with an error line, when that failed.
bool submitDailyLog(const std::string& bytes);

}  // namespace vesprun
