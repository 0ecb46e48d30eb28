#include "report/ReportSources.h"

#include <string>
#include <vector>

#include "platform/Platform.h"
#include "platform/PreferenceNames.h"
#include "report/SupportLibraryFunctions.h"

namespace vesprun {
namespace {

constexpr std::string_view kAllAppsKey = "com.quill.homeshell.numAllInstalledApps";
constexpr std::string_view kThirdPartyAppsKey = "com.quill.homeshell.numThirdPartyApps";
constexpr std::string_view kAppInstallsEvent = "com.quill.homeshell.appInstalls";
constexpr std::uint64_t kBytesPerMebibyte = 1048576;
constexpr const char* kDatabasePath = "/var/mobile/Library/Tallybook/TBDataStore.sqlitedb";

std::string firstOrUnknown(const std::vector<std::string>& languages) {
  return languages.empty() ? "<unknown>" : languages.front();
}

std::int64_t databaseMebibytes() {
  const std::optional<std::uint64_t> bytes = platform().fileSystem().fileSize(kDatabasePath);
  return bytes ? static_cast<std::int64_t>(*bytes / kBytesPerMebibyte) : -1;
}

std::int64_t takeCorruptionCount() {
  if (!resolveSupportLibraryFunctions()) {
    return 0;
  }
  Preferences& preferences = platform().preferences();
  const std::int64_t count =
      preferences.LGSPreferencesGetIntegerValue(kCorruptionCountKey, kAggregatedDomain);
  preferences.LGSPreferencesSetValue(kCorruptionCountKey, 0, kAggregatedDomain);
  return count;
}

std::int64_t minutesAwake() {
  Kernel& kernel = platform().kernel();
  const std::uint64_t ticks = kernel.monotonicTicks();
  const std::optional<TickRatio> ratio = kernel.tickRatio();
  if (!ratio || ratio->denominator == 0) {
    logMessage(LogLevel::Error, "Couldn't retrieve mach_timebase_info");
    return -1;
  }
  // The order of the operations decides the last bit.
  return saturatingTruncate(static_cast<double>(ratio->numerator) * 1e-9 /
                            static_cast<double>(ratio->denominator) / 60 *
                            static_cast<double>(ticks));
}

}  // namespace

void addInstalledAppInfo(TBReport& report) {
  const ScalarOptions* allAppsOptions = report.optionsForScalarKey(kAllAppsKey);
  const ScalarOptions* thirdPartyAppsOptions = report.optionsForScalarKey(kThirdPartyAppsKey);
  EventHub& eventHub = platform().eventHub();
  if (allAppsOptions == nullptr && thirdPartyAppsOptions == nullptr &&
      !eventHub.EventHubIsEventUsed(kAppInstallsEvent)) {
    return;
  }
  std::int64_t allApps = 0;
  std::int64_t thirdPartyApps = 0;
  platform().installedApplications().EnumerateInstalledBundles(
      [&](std::string_view /*bundle*/, BundleType type) {
        ++allApps;
        thirdPartyApps += type == BundleType::User ? 1 : 0;
      });
  if (allAppsOptions != nullptr) {
    report.addScalarForKeyWithOptions(allApps, kAllAppsKey, *allAppsOptions);
  }
  if (thirdPartyAppsOptions != nullptr) {
    report.addScalarForKeyWithOptions(thirdPartyApps, kThirdPartyAppsKey, *thirdPartyAppsOptions);
  }
  eventHub.EventHubSendEventLazy(kAppInstallsEvent, [&] {
    return PropertyDict{{"numThirdPartyApps", thirdPartyApps}, {"numAllApps", allApps}};
  });
}

void addMetadataKeys(PropertyDict& metadata) {
  Languages& languages = platform().languages();
  const std::vector<std::string> preferred = languages.preferredLanguages();
  metadata.set("TBUserInterfaceLanguage", firstOrUnknown(languages.bestLocalizations(
                                              languages.systemLocalizations(), preferred)));
  metadata.set("TBPreferredUserInterfaceLanguage", firstOrUnknown(preferred));
  if (const std::optional<std::string> country = languages.localeCountryCode()) {
    metadata.set("TBUserSetRegionFormat", *country);
  }
}

void reportDatabaseSize(TBReport& report) {
  report.addScalarForKeyByExecutingBlock("com.quill.logsmith.tlyd.database.size",
                                         databaseMebibytes);
  report.addScalarForKeyByExecutingBlock("com.quill.logsmith.tlyd.database.corruptions",
                                         takeCorruptionCount);
}

void reportCPUUptime(TBReport& report) {
  report.addScalarForKeyByExecutingBlock("com.quill.usage.cur_boot_session_cpu_uptime",
                                         minutesAwake);
}

}  // namespace vesprun
