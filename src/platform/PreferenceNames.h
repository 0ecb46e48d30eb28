#pragma once

#include <string_view>

namespace vesprun {

/// The job's own domain, its memory from one day to the next.
inline constexpr std::string_view kOwnDomain = "com.quill.aggregated.vesprun";

/// In it: the last day for which the daily tasks were run.
inline constexpr std::string_view kStoredDayKey = "LastCrashLogSerializationDateInDaysSince1970";

// And the current tasking, as the daily log reports it.
inline constexpr std::string_view kTaskingIDKey = "TaskingID";
inline constexpr std::string_view kTaskingDigestKey = "TaskingDigest";
inline constexpr std::string_view kTaskingPayloadKey = "TaskingPayload";

/// In the domain of all aggregated figures: how often the counter database was damaged.
inline constexpr std::string_view kAggregatedDomain = "com.quill.aggregated";
inline constexpr std::string_view kCorruptionCountKey = "DatabaseCorruptionCount";

}  // namespace vesprun
