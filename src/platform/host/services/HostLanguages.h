#pragma once

#include "platform/Languages.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

class HostLanguages : public Languages {
 public:
  explicit HostLanguages(const LanguageDescription& description) : _description(description) {}

  std::vector<std::string> preferredLanguages() override;
  std::vector<std::string> systemLocalizations() override;
  /// For each preferred language: the available one of the same tag, else one that the tag begins
  /// with ("en" for "en-GB"), else the first of the same language ("en-US" for "en-GB"). Languages
  /// without a match are skipped.
  std::vector<std::string> bestLocalizations(const std::vector<std::string>& available,
                                             const std::vector<std::string>& preferred) override;
  std::optional<std::string> localeCountryCode() override;

 private:
  const LanguageDescription& _description;
};

}  // namespace vesprun
