#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string_view>

#include "common/AppInfoList.h"
#include "config/TBConfig.h"
#include "platform/Tallybook.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The first of the two days whose rows a report of `day` reads. No day comes before the lowest
/// number, which is then read alone.
std::int32_t firstDayOfReport(std::int32_t day);

/// One day's aggregated log: collects the whitelisted counters, adds its own sources, and submits
/// the document. Used once. Without a whitelist it stays empty.
///
/// A later value for a key replaces the earlier one. Nothing fails: what a service does not answer
/// is left out or has a failure value (`ReportSources.h`).
class TBReport {
 public:
  using ScalarProducer = std::function<std::int64_t()>;

  /// Reads the whitelist.
  TBReport();

  /// With a whitelist that has been read; null: none.
  explicit TBReport(std::unique_ptr<TBConfig> config);

  /// Reads the rows of `day` and the day before, then `serializeWithDateAndAppInfo`. `appInfo` may
  /// be null.
  void writeLogForYesterdayWithAppInfo(std::int32_t day, const AppInfoList* appInfo);

  /// If there are scalars, distributions or histograms: runs the own sources and submits the
  /// document of `day`, moving the outputs into it.
  void serializeWithDateAndAppInfo(std::int32_t day, const AppInfoList* appInfo);

  // The steps of these two, for a report that is not submitted.

  /// Collects the rows of `day` and the day before it. False when the history could not be read to
  /// its end; what came before is collected.
  bool readHistory(std::int32_t day);

  /// Side effects of submitting a report: offers the event of the installed
  /// apps, restarts the count of corruptions.
  enum class SideEffects { Done, LeftOut };

  /// Runs the log's own sources and builds the document without the active apps; the outputs are
  /// moved into it. Nothing when scalars, distributions and histograms are all empty.
  std::optional<PropertyDict> makeDocument(std::int32_t day, SideEffects sideEffects);

  /// The whitelist's options for a scalar; null keeps it out.
  const ScalarOptions* optionsForScalarKey(std::string_view key) const;

  /// Stores the rounded value (`roundScalar`) and returns it.
  std::int64_t addScalarForKeyWithOptions(std::int64_t value, std::string_view key,
                                          const ScalarOptions& options);

  /// Runs the producer only for a whitelisted key.
  void addScalarForKeyByExecutingBlock(std::string_view key, const ScalarProducer& producer);

  /// Stores the statistics of the values and, if the options have "intervals", their histogram; an
  /// empty histogram removes the key's earlier one. Without memory for the histogram a log line
  /// says so, and only the statistics are stored.
  void computeAndAddDistributionForKeyWithOptions(TBHistoryDistributionEnumerator& values,
                                                  std::string_view key,
                                                  const DistributionOptions& options);

  const PropertyDict& scalarsOutput() const { return _scalarsOutput; }
  const PropertyDict& distributionsOutput() const { return _distributionsOutput; }
  const PropertyDict& histogramsOutput() const { return _histogramsOutput; }

 private:
  void addOwnSources(SideEffects sideEffects);

  std::unique_ptr<TBConfig> _config;  ///< null without a whitelist, and after its digest was taken
  PropertyDict _scalarsOutput;
  PropertyDict _distributionsOutput;
  PropertyDict _histogramsOutput;
  PropertyDict _metadataOutput;
};

}  // namespace vesprun
