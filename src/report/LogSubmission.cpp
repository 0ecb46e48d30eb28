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

PtreeDocument withApps(const PropertyDict& document, const AppInfoList* appInfo) {
  if (appInfo == nullptr) {
    return {document};
  }
  return {document, "TBActivatedAppInfo", [appInfo](const auto& take) { appInfo->forEach(take); }};
}

}  // namespace

bool canSerializeDailyLog(const PropertyDict& document, const AppInfoList* appInfo) {
  std::string error;
  if (!platform().ptreeSerialization().canSerialize(withApps(document, appInfo), error)) {
    logMessage(LogLevel::Error, "Could not create aggregated ptree: %s", error.c_str());
    return false;
  }
  return true;
}

bool submitDailyLog(const PropertyDict& document, const AppInfoList* appInfo) {
  if (!canSerializeDailyLog(document, appInfo)) {
    return false;
  }
  Preferences& preferences = platform().preferences();
  const std::optional<PropertyValue> last =
      preferences.LGSPreferencesGetValue(kLastOSVersionKey, kOwnDomain);
  const PropertyValue osVersion = platform().logsmith().LGSOSVersion();
  const PropertyDict header = headerOf(last, osVersion);
  if (!header.empty()) {
    preferences.LGSPreferencesSetValue(kLastOSVersionKey, osVersion, kOwnDomain);
    preferences.LGSPreferencesSynchronize(kOwnDomain);
  }
  const bool submitted = platform().logsmith().LGSWriteLogForSubmission(
      "193", "log-aggregated", header.empty() ? nullptr : &header, [&](const LogFileHandle& write) {
        platform().ptreeSerialization().serialize(withApps(document, appInfo), write);
      });
  if (!submitted) {
    logMessage(LogLevel::Error, "%s", kSubmissionFailed);
  }
  return submitted;
}

}  // namespace vesprun
