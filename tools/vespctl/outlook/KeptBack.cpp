#include "outlook/KeptBack.h"

#include <memory>
#include <set>
#include <string_view>

#include "config/TBConfig.h"
#include "platform/Platform.h"

namespace vesprun {

std::optional<std::vector<KeptBack>> keysKeptBack(std::int32_t first, std::int32_t last) {
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  const std::unique_ptr<TBHistory> history = platform().tallybook().initWithDefaultPath();
  std::vector<KeptBack> keptBack;
  std::set<std::string, std::less<>> scalars;
  std::set<std::string, std::less<>> distributions;
  const bool complete =
      history->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
          "", first, last,
          [&](std::string_view key, std::int32_t, std::int64_t, bool&) {
            if (scalars.emplace(key).second &&
                (!config || config->decide<ScalarOptions>(key).options() == nullptr)) {
              keptBack.push_back({false, std::string(key)});
            }
          }) &&
      history->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
          "", first, last,
          [&](std::string_view key, std::int32_t, TBHistoryDistributionEnumerator&, bool&) {
            if (distributions.emplace(key).second &&
                (!config || config->decide<DistributionOptions>(key).options() == nullptr)) {
              keptBack.push_back({true, std::string(key)});
            }
          });
  return complete ? std::optional(std::move(keptBack)) : std::nullopt;
}

}  // namespace vesprun
