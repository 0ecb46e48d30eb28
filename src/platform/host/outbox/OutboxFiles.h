#pragma once

#include <string_view>

namespace vesprun {

inline constexpr std::string_view kOutbox = "outbox";
inline constexpr std::string_view kLogFolder = "outbox/logs";

// Lines for whoever collects them.
inline constexpr std::string_view kRecordsFile = "outbox/records.jsonl";
inline constexpr std::string_view kEventsFile = "outbox/events.jsonl";
inline constexpr std::string_view kNotificationsFile = "outbox/notifications.jsonl";
inline constexpr std::string_view kSystemLogFile = "outbox/log.jsonl";

// Notes on logs.
inline constexpr std::string_view kSubmittedFile = "outbox/submitted.jsonl";
inline constexpr std::string_view kUploadedFile = "outbox/uploaded.jsonl";
inline constexpr std::string_view kPrunedFile = "outbox/pruned.jsonl";

}  // namespace vesprun
