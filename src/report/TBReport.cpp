#include "report/TBReport.h"

#include <limits>
#include <string>
#include <utility>

#include "platform/Platform.h"
#include "report/DistributionBatch.h"
#include "report/KernelMemoryStatistics.h"
#include "report/LogSubmission.h"
#include "report/ReportSources.h"
#include "report/RoundScalar.h"

namespace vesprun {
namespace {

PropertyValue preferenceOr(std::string_view key, PropertyValue fallback) {
  std::optional<PropertyValue> value =
      platform().preferences().LGSPreferencesGetValue(key, kOwnDomain);
  return value ? *std::move(value) : std::move(fallback);
}

}  // namespace

std::int32_t firstDayOfReport(std::int32_t day) {
  return day == std::numeric_limits<std::int32_t>::min() ? day : day - 1;
}

TBReport::TBReport() : TBReport(TBConfig::init()) {}

TBReport::TBReport(std::unique_ptr<TBConfig> config) : _config(std::move(config)) {}

const ScalarOptions* TBReport::optionsForScalarKey(std::string_view key) const {
  return _config ? _config->configOptionsForScalarKey(key) : nullptr;
}

void TBReport::writeLogForYesterdayWithAppInfo(std::int32_t day, const AppInfoList* appInfo) {
  logMessage(LogLevel::Info, "writing aggregated log. yesterday=%d", day);
  readHistory(day);
  serializeWithDateAndAppInfo(day, appInfo);
}

void TBReport::serializeWithDateAndAppInfo(std::int32_t day, const AppInfoList* appInfo) {
  if (const auto document = makeDocument(day, SideEffects::Done)) {
    submitDailyLog(*document, appInfo);
  }
}

bool TBReport::readHistory(std::int32_t day) {
  const std::unique_ptr<TBHistory> history = platform().tallybook().initWithDefaultPath();
  if (!history) {
    return false;
  }
  const std::int32_t firstDay = firstDayOfReport(day);
  const bool allScalars = history->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
      "", firstDay, day,
      [this](std::string_view key, std::int32_t /*day*/, std::int64_t value, bool& /*stop*/) {
        if (const ScalarOptions* options = optionsForScalarKey(key)) {
          addScalarForKeyWithOptions(value, key, *options);
        }
      });
  DistributionBatch distributions(_distributionsOutput, _histogramsOutput);
  const bool allDistributions =
      history->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
          "", firstDay, day,
          [&](std::string_view key, std::int32_t /*day*/, TBHistoryDistributionEnumerator& values,
              bool& /*stop*/) {
            if (const DistributionOptions* options =
                    _config ? _config->configOptionsForDistributionKey(key) : nullptr) {
              distributions.add(values, key, *options);
            }
          });
  distributions.finish();
  return allScalars && allDistributions;
}

void TBReport::addOwnSources(SideEffects sideEffects) {
  const bool done = sideEffects == SideEffects::Done;
  if (const std::optional<InstalledAppCounts> counts = addInstalledAppInfo(*this); counts && done) {
    offerAppInstallsEvent(*counts);
  }
  addMetadataKeys(_metadataOutput);
  if (reportDatabaseSize(*this) && done) {
    restartCorruptionCount();
  }
  reportCPUUptime(*this);
  reportVMStats(*this);
}

std::optional<PropertyDict> TBReport::makeDocument(std::int32_t day, SideEffects sideEffects) {
  if (_scalarsOutput.empty() && _distributionsOutput.empty() && _histogramsOutput.empty()) {
    return std::nullopt;
  }
  addOwnSources(sideEffects);
  const std::string whitelistDigest = _config ? _config->configFileDigest() : "";
  _config.reset();
  PropertyValue identifier = preferenceOr(kTaskingIDKey, "(no tasking id)");
  PropertyValue digest = preferenceOr(kTaskingDigestKey, "(no tasking digest)");
  PropertyValue payload = preferenceOr(kTaskingPayloadKey, PropertyArray());
  PropertyDict document;
  document.set("TBCrashLogVersion", 1);
  document.set("TBStartDate", platform().tallybook().dateForDaysSince1970(day));
  document.set("TBLogCreationDate", platform().clock().now());
  document.set("TBMetadata", std::exchange(_metadataOutput, {}));
  document.set("TBScalars", std::exchange(_scalarsOutput, {}));
  document.set("TBDistributions", std::exchange(_distributionsOutput, {}));
  document.set("TBDistributionsHistogram", std::exchange(_histogramsOutput, {}));
  document.set("TBTasking", std::move(payload));
  document.set("TBTaskID", std::move(identifier));
  document.set("TBTaskDigest", std::move(digest));
  document.set("TBWhitelistDigest", whitelistDigest);
  return document;
}

std::int64_t TBReport::addScalarForKeyWithOptions(std::int64_t value, std::string_view key,
                                                  const ScalarOptions& options) {
  const std::int64_t rounded = roundScalar(value, options);
  _scalarsOutput.set(key, rounded);
  return rounded;
}

void TBReport::addScalarForKeyByExecutingBlock(std::string_view key,
                                               const ScalarProducer& producer) {
  if (const ScalarOptions* options = optionsForScalarKey(key)) {
    addScalarForKeyWithOptions(producer(), key, *options);
  }
}

void TBReport::computeAndAddDistributionForKeyWithOptions(TBHistoryDistributionEnumerator& values,
                                                          std::string_view key,
                                                          const DistributionOptions& options) {
  DistributionBatch alone(_distributionsOutput, _histogramsOutput);
  alone.add(values, key, options);
  alone.finish();
}

}  // namespace vesprun
