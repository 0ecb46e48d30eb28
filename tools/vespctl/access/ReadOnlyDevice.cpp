#include "access/ReadOnlyDevice.h"

#include <limits>
#include <set>

#include "platform/Platform.h"

namespace vesprun {

bool forEachRow(std::int32_t first, std::int32_t last, const RowHandler& take,
                std::string_view keyPrefix) {
  const std::unique_ptr<TBHistory> history = platform().tallybook().initWithDefaultPath();
  return history->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
             keyPrefix, first, last,
             [&take](std::string_view key, std::int32_t, std::int64_t, bool&) {
               take(false, key);
             }) &&
         history->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
             keyPrefix, first, last,
             [&take](std::string_view key, std::int32_t, TBHistoryDistributionEnumerator&, bool&) {
               take(true, key);
             });
}

bool forEachRow(const RowHandler& take, std::string_view keyPrefix) {
  using Days = std::numeric_limits<std::int32_t>;
  return forEachRow(Days::min(), Days::max(), take, keyPrefix);
}

std::vector<std::string> countedKeys() {
  const ReadOnlyDevice opened;
  std::set<std::string, std::less<>> keys;
  forEachRow([&keys](bool, std::string_view key) { keys.emplace(key); });
  return {keys.begin(), keys.end()};
}

}  // namespace vesprun
