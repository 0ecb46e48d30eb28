#include "preview/KeptBack.h"

#include <memory>
#include <set>
#include <utility>

#include "access/ReadOnlyDevice.h"
#include "config/TBConfig.h"

namespace vesprun {

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
