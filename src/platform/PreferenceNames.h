#pragma once

#include <string_view>

namespace vesprun {

/// The job's own preference domain, where it keeps what it remembers from one day to the next.
inline constexpr std::string_view kOwnDomain = "com.quill.aggregated.vesprun";

/// In it: the last day for which the daily tasks were run.
inline constexpr std::string_view kStoredDayKey = "LastCrashLogSerializationDateInDaysSince1970";

// And the tasking that is in force, and what the daily log says of it.
inline constexpr std::string_view kTaskingIDKey = "TaskingID";
inline constexpr std::string_view kTaskingDigestKey = "TaskingDigest";
inline constexpr std::string_view kTaskingPayloadKey = "TaskingPayload";

/// How often the counter database was found damaged, in the domain of all aggregated figures.
inline constexpr std::string_view kAggregatedDomain = "com.quill.aggregated";
inline constexpr std::string_view kCorruptionCountKey = "DatabaseCorruptionCount";

}  // namespace vesprun
