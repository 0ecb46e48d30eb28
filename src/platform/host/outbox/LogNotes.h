#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/host/device/DeviceDirectory.h"
#include "vesprun/Date.h"

namespace vesprun {

/// A daily log that was removed from the outbox, or whose upload was acknowledged.
struct LogNote {
  std::string name;
  std::uint64_t number = 0;   ///< that the name begins with; 0 when it begins with none
  std::int32_t day = 0;       ///< that the log reported
  std::int64_t revision = 0;  ///< of that day, from 1
};

/// What the device's `system` answered when a daily log was submitted.
struct SubmittedNote {
  std::optional<std::string> build;
  std::optional<std::string> model;
};

/// The notes in `kPrunedFile` or `kUploadedFile`, in their order. Lines of another form are passed
/// over. Nothing, with a text in `error`, when the file is there and cannot be read.
std::optional<std::vector<LogNote>> readLogNotes(const DeviceDirectory& directory,
                                                 std::string_view file, std::string& error);

/// Adds notes to one of these files; they are durable when it returns. False, with a text in
/// `error`, on failure.
bool addLogNotes(const DeviceDirectory& directory, std::string_view file, const Date& time,
                 const std::vector<LogNote>& notes, std::string& error);

/// The notes in `kSubmittedFile` by the logs' names; of two of one name the last counts. Otherwise
/// as `readLogNotes`.
std::optional<std::map<std::string, SubmittedNote>> readSubmittedNotes(
    const DeviceDirectory& directory, std::string& error);

bool addSubmittedNote(const DeviceDirectory& directory, const Date& time, const std::string& name,
                      const SubmittedNote& note, std::string& error);

/// Removes from `kSubmittedFile` and `kUploadedFile` the notes on logs that are not in the outbox
/// any more. Call with the lock of `kLogFolder`.
bool removeStaleNotes(const DeviceDirectory& directory, std::string& error);

}  // namespace vesprun
