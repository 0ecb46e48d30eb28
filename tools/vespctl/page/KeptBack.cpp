#include "page/KeptBack.h"

#include <limits>
#include <set>
#include <string_view>

#include "Command.h"
#include "config/TBConfig.h"
#include "platform/host/counters/HostTallybook.h"

namespace vesprun {

std::vector<KeptBack> keysKeptBack(HostPlatform& device) {
  using Days = std::numeric_limits<std::int32_t>;
  const InstalledPlatform installed(device);
  const std::unique_ptr<TBConfig> whitelist = TBConfig::init();
  std::set<std::string, std::less<>> scalars;
  std::set<std::string, std::less<>> distributions;
  const auto read = [&](CounterStore& store) {
    scalars.clear();
    distributions.clear();
    store.readScalars("", Days::min(), Days::max(),
                      [&](std::string_view key, std::int32_t /*day*/, std::int64_t /*value*/,
                          bool& /*stop*/) { scalars.emplace(key); });
    store.readDistributions(
        "", Days::min(), Days::max(),
        [&](std::string_view key, std::int32_t /*day*/, TBHistoryDistributionEnumerator& /*values*/,
            bool& /*stop*/) { distributions.emplace(key); });
  };
  std::string error;
  if (!device.counters().read(read, error)) {
    throw CommandFailure(error);
  }
  std::vector<KeptBack> kept;
  for (const std::string& key : scalars) {
    if (!whitelist || whitelist->decideScalarKey(key).options() == nullptr) {
      kept.push_back({false, key});
    }
  }
  for (const std::string& key : distributions) {
    if (!whitelist || whitelist->decideDistributionKey(key).options() == nullptr) {
      kept.push_back({true, key});
    }
  }
  return kept;
}

}  // namespace vesprun
