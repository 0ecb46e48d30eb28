#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string_view>

#include "common/AppInfoList.h"
#include "common/PropertyDict.h"
#include "config/TBConfig.h"
#include "platform/Tallybook.h"

namespace vesprun {

/// The first of the two days whose rows a report of `day` reads. No day comes before the lowest
/// number, which is then read alone.
std::int32_t firstDayOfReport(std::int32_t day);

/// One day's aggregated log: collects the whitelisted counters, adds its own sources, and submits
/// the document. Made for one run and used once. Without a whitelist it stays empty and submits
/// nothing.
///
/// A later value for a key replaces the earlier one. Nothing here fails: what a service does not
/// answer is left out or stands in the log as the failure value that is stated below.
class TBReport {
 public:
  using ScalarProducer = std::function<std::int64_t()>;

  /// Reads the whitelist.
  TBReport();

  /// With a whitelist that has been read; null: none.
  explicit TBReport(std::unique_ptr<TBConfig> config);

  /// Reads the history of day `day` and the day before it, then `serializeWithDateAndAppInfo`.
  /// `appInfo` may be null.
  void writeLogForYesterdayWithAppInfo(std::int32_t day, const AppInfoList* appInfo);

  /// Unless scalars, distributions and histograms are all empty: runs the log's own sources, and
  /// submits the document of `day`, into which the outputs are moved.
  void serializeWithDateAndAppInfo(std::int32_t day, const AppInfoList* appInfo);

  // The steps of these two, to look at a report that is not submitted.

  /// Collects the rows of `day` and the day before it. False when the history could not be read to
  /// its end; what came before is collected.
  bool readHistory(std::int32_t day);

  /// What a submitted report does on the device beside the log: offers the event of the installed
  /// apps, restarts the count of corruptions.
  enum class SideEffects { Done, LeftOut };

  /// Runs the log's own sources and builds the document, into which the outputs are moved. Nothing
  /// when scalars, distributions and histograms are all empty.
  std::optional<PropertyDict> makeDocument(std::int32_t day, const AppInfoList* appInfo,
                                           SideEffects sideEffects);

  /// The options with which the whitelist lets a scalar through; null when it does not.
  const ScalarOptions* optionsForScalarKey(std::string_view key) const;

  /// Stores `value`, rounded as the options ask (`roundScalar`), and returns what was stored.
  std::int64_t addScalarForKeyWithOptions(std::int64_t value, std::string_view key,
                                          const ScalarOptions& options);

  /// Runs the producer and adds what it yields, only when the key is whitelisted.
  void addScalarForKeyByExecutingBlock(std::string_view key, const ScalarProducer& producer);

  /// Goes once through the values and stores their statistics and, when the options name
  /// "intervals", their histogram; an empty histogram removes the key's earlier one. Memory is one
  /// counter and one boundary for each bucket. When there is none to be had, a log line says so and
  /// the statistics are stored alone.
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
