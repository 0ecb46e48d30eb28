#pragma once

#include <optional>
#include <string>
#include <vector>

namespace vesprun {

/// The user's language and region settings. Languages are tags such as "en-GB".
class Languages {
 public:
  virtual ~Languages() = default;

  /// By the user's preference, most wanted first.
  virtual std::vector<std::string> preferredLanguages() = 0;

  /// The languages that the system is localized for.
  virtual std::vector<std::string> systemLocalizations() = 0;

  /// The best of `available` for a user with these preferences, best first.
  virtual std::vector<std::string> bestLocalizations(const std::vector<std::string>& available,
                                                     const std::vector<std::string>& preferred) = 0;

  /// The country code of the current locale, if it names one.
  virtual std::optional<std::string> localeCountryCode() = 0;
};

}  // namespace vesprun
