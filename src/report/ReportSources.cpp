#include "report/ReportSources.h"

#include <string>
#include <vector>

#include "common/ProcessState.h"
#include "platform/Platform.h"
#include "report/KernelMemoryStatistics.h"

namespace vesprun {
namespace {

constexpr std::string_view kAllAppsKey = "com.quill.homeshell.numAllInstalledApps";
constexpr std::string_view kThirdPartyAppsKey = "com.quill.homeshell.numThirdPartyApps";
constexpr std::string_view kDatabaseSizeKey = "com.quill.logsmith.tlyd.database.size";
constexpr std::string_view kCorruptionsKey = "com.quill.logsmith.tlyd.database.corruptions";
constexpr std::string_view kCPUUptimeKey = "com.quill.usage.cur_boot_session_cpu_uptime";
constexpr std::string_view kAppInstallsEvent = "com.quill.homeshell.appInstalls";
constexpr std::uint64_t kBytesPerMebibyte = 1048576;
constexpr const char* kDatabasePath = "/var/mobile/Library/Tallybook/TBDataStore.sqlitedb";

std::string firstOrUnknown(const std::vector<std::string>& languages) {
  return languages.empty() ? "<unknown>" : languages.front();
}

bool gBothResolved = false;
const ProcessState kResolvedState([] { gBothResolved = false; });

/// Finds the two preference functions in the crash-report support library. False, with an error
/// line for each missing part, until both are there; then the library is not asked again.
bool resolveSupportLibraryFunctions() {
  if (gBothResolved) {
    return true;
  }
  DeviceInformation& device = platform().deviceInformation();
  if (!device.loadSupportLibrary()) {
    logMessage(LogLevel::Error, "Failed to dynamically load the FaultlineSupport framework");
    return false;
  }
  const bool reads = device.supportLibraryOffers("LGSPreferencesGetIntegerValue");
  if (!reads) {
    logMessage(LogLevel::Error, "Failed to dyanmically link LGSPreferencesGetIntegerValue");
  }
  const bool writes = device.supportLibraryOffers("LGSPreferencesSetValue");
  if (!writes) {
    logMessage(LogLevel::Error, "Failed to dynamically link LGSPreferencesSetValue");
  }
  gBothResolved = reads && writes;
  return gBothResolved;
}

std::int64_t databaseMebibytes() {
  const std::optional<std::uint64_t> bytes = platform().fileSystem().fileSize(kDatabasePath);
  return bytes ? static_cast<std::int64_t>(*bytes / kBytesPerMebibyte) : -1;
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

std::vector<std::string_view> ownScalarKeys() {
  std::vector<std::string_view> keys{kAllAppsKey, kThirdPartyAppsKey, kDatabaseSizeKey,
                                     kCorruptionsKey, kCPUUptimeKey};
  const std::vector<std::string_view> ofMemory = vmStatisticKeys();
  keys.insert(keys.end(), ofMemory.begin(), ofMemory.end());
  return keys;
}

std::optional<InstalledAppCounts> addInstalledAppInfo(TBReport& report) {
  const ScalarOptions* allAppsOptions = report.optionsForScalarKey(kAllAppsKey);
  const ScalarOptions* thirdPartyAppsOptions = report.optionsForScalarKey(kThirdPartyAppsKey);
  if (allAppsOptions == nullptr && thirdPartyAppsOptions == nullptr &&
      !platform().eventHub().EventHubIsEventUsed(kAppInstallsEvent)) {
    return std::nullopt;
  }
  InstalledAppCounts counts;
  platform().deviceInformation().EnumerateInstalledBundles(
      [&](std::string_view /*bundle*/, BundleType type) {
        ++counts.all;
        counts.thirdParty += type == BundleType::User ? 1 : 0;
      });
  if (allAppsOptions != nullptr) {
    report.addScalarForKeyWithOptions(counts.all, kAllAppsKey, *allAppsOptions);
  }
  if (thirdPartyAppsOptions != nullptr) {
    report.addScalarForKeyWithOptions(counts.thirdParty, kThirdPartyAppsKey,
                                      *thirdPartyAppsOptions);
  }
  return counts;
}

void offerAppInstallsEvent(const InstalledAppCounts& counts) {
  platform().eventHub().EventHubSendEventLazy(kAppInstallsEvent, [&counts] {
    return PropertyDict{{"numThirdPartyApps", counts.thirdParty}, {"numAllApps", counts.all}};
  });
}

void addMetadataKeys(PropertyDict& metadata) {
  DeviceInformation& device = platform().deviceInformation();
  const std::vector<std::string> preferred = device.preferredLanguages();
  metadata.set("TBUserInterfaceLanguage",
               firstOrUnknown(device.bestLocalizations(device.systemLocalizations(), preferred)));
  metadata.set("TBPreferredUserInterfaceLanguage", firstOrUnknown(preferred));
  if (const std::optional<std::string> country = device.localeCountryCode()) {
    metadata.set("TBUserSetRegionFormat", *country);
  }
}

bool reportDatabaseSize(TBReport& report) {
  report.addScalarForKeyByExecutingBlock(kDatabaseSizeKey, databaseMebibytes);
  bool corruptionsWereRead = false;
  report.addScalarForKeyByExecutingBlock(kCorruptionsKey, [&corruptionsWereRead] {
    corruptionsWereRead = resolveSupportLibraryFunctions();
    return corruptionsWereRead ? platform().preferences().LGSPreferencesGetIntegerValue(
                                     kCorruptionCountKey, kAggregatedDomain)
                               : 0;
  });
  return corruptionsWereRead;
}

void restartCorruptionCount() {
  platform().preferences().LGSPreferencesSetValue(kCorruptionCountKey, 0, kAggregatedDomain);
}

void reportCPUUptime(TBReport& report) {
  report.addScalarForKeyByExecutingBlock(kCPUUptimeKey, minutesAwake);
}

}  // namespace vesprun
