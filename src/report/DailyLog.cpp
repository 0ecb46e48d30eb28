// The document of a daily log, and its submission.

#include <string>
#include <utility>

#include "common/TextForm.h"
#include "platform/Platform.h"
#include "platform/PreferenceNames.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

constexpr std::string_view kLastOSVersionKey = "LastOSVersion";

PropertyValue preferenceOr(std::string_view key, PropertyValue fallback) {
  std::optional<PropertyValue> value =
      platform().preferences().LGSPreferencesGetValue(key, kOwnDomain);
  return value ? *std::move(value) : std::move(fallback);
}

/// Names the previous OS version when it has changed since the last log, and keeps the current one.
PropertyDict headerOfOSVersionChange() {
  Preferences& preferences = platform().preferences();
  const std::optional<PropertyValue> last =
      preferences.LGSPreferencesGetValue(kLastOSVersionKey, kOwnDomain);
  const PropertyValue current = platform().logsmith().LGSOSVersion();
  if (last == current) {
    return {};
  }
  preferences.LGSPreferencesSetValue(kLastOSVersionKey, current, kOwnDomain);
  preferences.LGSPreferencesSynchronize(kOwnDomain);
  return {{"previous_os_version", last ? textForm(*last) : "<unknown>"}};
}

}  // namespace

void TBReport::serializeWithDateAndAppInfo(std::int32_t day, const AppInfoList* appInfo) {
  if (_scalarsOutput.empty() && _distributionsOutput.empty() && _histogramsOutput.empty()) {
    return;
  }
  addInstalledAppInfo();
  addMetadataKeys();
  reportDatabaseSize();
  reportCPUUptime();
  reportVMStats();
  submit(buildDocument(day, appInfo));
}

PropertyDict TBReport::buildDocument(std::int32_t day, const AppInfoList* appInfo) {
  const std::string whitelistDigest = _config ? _config->configFileDigest() : "";
  _config.reset();
  PropertyValue taskID = preferenceOr(kTaskingIDKey, "(no tasking id)");
  PropertyValue taskDigest = preferenceOr(kTaskingDigestKey, "(no tasking digest)");
  PropertyValue tasking = preferenceOr(kTaskingPayloadKey, PropertyArray());

  PropertyDict document;
  document.set("TBCrashLogVersion", 1);
  document.set("TBStartDate", platform().tallybook().dateForDaysSince1970(day));
  document.set("TBLogCreationDate", platform().clock().now());
  document.set("TBMetadata", std::exchange(_metadataOutput, {}));
  document.set("TBScalars", std::exchange(_scalarsOutput, {}));
  document.set("TBDistributions", std::exchange(_distributionsOutput, {}));
  document.set("TBDistributionsHistogram", std::exchange(_histogramsOutput, {}));
  document.set("TBTasking", std::move(tasking));
  document.set("TBTaskID", std::move(taskID));
  document.set("TBTaskDigest", std::move(taskDigest));
  document.set("TBWhitelistDigest", whitelistDigest);
  if (appInfo != nullptr) {
    document.set("TBActivatedAppInfo", appInfo->array());
  }
  return document;
}

void TBReport::submit(const PropertyDict& document) {
  std::string error;
  const std::optional<std::string> bytes =
      platform().ptreeSerialization().serialize(document, error);
  if (!bytes) {
    logMessage(LogLevel::Error, "Could not create aggregated ptree: %s", error.c_str());
    return;
  }
  const PropertyDict header = headerOfOSVersionChange();
  const bool submitted = platform().logsmith().LGSWriteLogForSubmission(
      "193", "log-aggregated", header.empty() ? nullptr : &header,
      [&bytes](LogFileHandle& file) { file.write(*bytes); });
  if (!submitted) {
    logMessage(LogLevel::Error, "Failed to write aggregated log");
  }
}

}  // namespace vesprun
