#include <string>
#include <vector>

#include "platform/Platform.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

std::string firstOrUnknown(const std::vector<std::string>& languages) {
  return languages.empty() ? "<unknown>" : languages.front();
}

}  // namespace

void TBReport::addMetadataKeys() {
  Languages& languages = platform().languages();
  const std::vector<std::string> preferred = languages.preferredLanguages();
  _metadataOutput.set("TBUserInterfaceLanguage", firstOrUnknown(languages.bestLocalizations(
                                                     languages.systemLocalizations(), preferred)));
  _metadataOutput.set("TBPreferredUserInterfaceLanguage", firstOrUnknown(preferred));
  if (const std::optional<std::string> country = languages.localeCountryCode()) {
    _metadataOutput.set("TBUserSetRegionFormat", *country);
  }
}

}  // namespace vesprun
