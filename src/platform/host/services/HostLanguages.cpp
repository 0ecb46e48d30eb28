#include "platform/host/services/HostLanguages.h"

#include <algorithm>
#include <string_view>

#include "platform/host/device/LiveSystem.h"

namespace vesprun {
namespace {

std::string_view languageOf(std::string_view tag) { return tag.substr(0, tag.find('-')); }

const std::string* bestFor(std::string_view wanted, const std::vector<std::string>& available) {
  for (std::string_view tag = wanted; !tag.empty();) {
    const auto found = std::find(available.begin(), available.end(), tag);
    if (found != available.end()) {
      return &*found;
    }
    const auto end = tag.rfind('-');
    tag = tag.substr(0, end == std::string_view::npos ? 0 : end);
  }
  const auto related = std::find_if(available.begin(), available.end(), [&](const auto& tag) {
    return languageOf(tag) == languageOf(wanted);
  });
  return related != available.end() ? &*related : nullptr;
}

}  // namespace

std::vector<std::string> HostLanguages::preferredLanguages() {
  return _description.preferred ? *_description.preferred : live::preferredLanguages();
}

std::vector<std::string> HostLanguages::systemLocalizations() {
  return _description.localizations ? *_description.localizations : live::localizations();
}

std::vector<std::string> HostLanguages::bestLocalizations(
    const std::vector<std::string>& available, const std::vector<std::string>& preferred) {
  std::vector<std::string> best;
  for (const std::string& wanted : preferred) {
    const std::string* found = bestFor(wanted, available);
    if (found != nullptr && std::find(best.begin(), best.end(), *found) == best.end()) {
      best.push_back(*found);
    }
  }
  return best;
}

std::optional<std::string> HostLanguages::localeCountryCode() {
  return _description.country.isLive() ? live::countryCode() : _description.country.value;
}

}  // namespace vesprun
