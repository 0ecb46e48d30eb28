#include "outlook/KeptBack.h"

#include <memory>
#include <set>
#include <utility>

#include "config/TBConfig.h"
#include "platform/Platform.h"

namespace vesprun {

bool forEachRow(std::int32_t first, std::int32_t last,
                const std::function<void(bool isDistribution, std::string_view key)>& take) {
  const std::unique_ptr<TBHistory> history = platform().tallybook().initWithDefaultPath();
  return history->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
             "", first, last,
             [&take](std::string_view key, std::int32_t, std::int64_t, bool&) {
               take(false, key);
             }) &&
         history->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
             "", first, last,
             [&take](std::string_view key, std::int32_t, TBHistoryDistributionEnumerator&, bool&) {
               take(true, key);
             });
}

std::optional<std::vector<KeptBack>> keysKeptBack(std::int32_t first, std::int32_t last) {
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  const auto leaves = [&config](bool isDistribution, std::string_view key) {
    return config && (isDistribution ? config->decide<DistributionOptions>(key).options() != nullptr
                                     : config->decide<ScalarOptions>(key).options() != nullptr);
  };
  std::vector<KeptBack> keptBack;
  std::set<std::pair<bool, std::string>> seen;
  const bool complete = forEachRow(first, last, [&](bool isDistribution, std::string_view key) {
    if (seen.emplace(isDistribution, key).second && !leaves(isDistribution, key)) {
      keptBack.push_back({isDistribution, std::string(key)});
    }
  });
  return complete ? std::optional(std::move(keptBack)) : std::nullopt;
}

}  // namespace vesprun
