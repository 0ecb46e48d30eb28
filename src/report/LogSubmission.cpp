#include "report/LogSubmission.h"

#include <string>

#include "common/TextForm.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::string_view kLastOSVersionKey = "LastOSVersion";

/// Names the previous OS version when it has changed since the last log.
PropertyDict headerOf(const std::optional<PropertyValue>& last, const PropertyValue& current) {
  if (last == current) {
    return {};
  }
  return {{"previous_os_version", last ? textForm(*last) : "<unknown>"}};
}

}  // namespace

std::optional<std::string> serializeDailyLog(const PropertyDict& document) {
  std::string error;
  std::optional<std::string> bytes = platform().ptreeSerialization().serialize(document, error);
  if (!bytes) {
    logMessage(LogLevel::Error, "Could not create aggregated ptree: %s", error.c_str());
  }
  return bytes;
}

bool submitDailyLog(const std::string& bytes) {
  Preferences& preferences = platform().preferences();
  const PropertyValue osVersion = platform().logsmith().LGSOSVersion();
  const PropertyDict header =
      headerOf(preferences.LGSPreferencesGetValue(kLastOSVersionKey, kOwnDomain), osVersion);
  if (!header.empty()) {
    preferences.LGSPreferencesSetValue(kLastOSVersionKey, osVersion, kOwnDomain);
    preferences.LGSPreferencesSynchronize(kOwnDomain);
  }
  const bool submitted = platform().logsmith().LGSWriteLogForSubmission(
      "193", "log-aggregated", header.empty() ? nullptr : &header,
      [&bytes](const LogFileHandle& write) { write(bytes); });
  if (!submitted) {
    logMessage(LogLevel::Error, "%s", kSubmissionFailed);
  }
  return submitted;
}

}  // namespace vesprun
