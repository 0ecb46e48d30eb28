#include "platform/Platform.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

constexpr std::string_view kAllAppsKey = "com.quill.homeshell.numAllInstalledApps";
constexpr std::string_view kThirdPartyAppsKey = "com.quill.homeshell.numThirdPartyApps";
constexpr std::string_view kAppInstallsEvent = "com.quill.homeshell.appInstalls";

}  // namespace

void TBReport::addInstalledAppInfo() {
  const ScalarOptions* allAppsOptions = optionsForScalarKey(kAllAppsKey);
  const ScalarOptions* thirdPartyAppsOptions = optionsForScalarKey(kThirdPartyAppsKey);
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
    addScalarForKeyWithOptions(allApps, kAllAppsKey, *allAppsOptions);
  }
  if (thirdPartyAppsOptions != nullptr) {
    addScalarForKeyWithOptions(thirdPartyApps, kThirdPartyAppsKey, *thirdPartyAppsOptions);
  }
  eventHub.EventHubSendEventLazy(kAppInstallsEvent, [&] {
    return PropertyDict{{"numThirdPartyApps", thirdPartyApps}, {"numAllApps", allApps}};
  });
}

}  // namespace vesprun
