#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "vesprun/PropertyDict.h"

namespace vesprun {

// The entries of the answer to "DiskUsage", a dictionary: signed 64-bit byte counts.
inline constexpr std::string_view kDiskUsageTotalDiskCapacity = "TotalDiskCapacity";
inline constexpr std::string_view kDiskUsageTotalDataAvailable = "TotalDataAvailable";
inline constexpr std::string_view kDiskUsageAmountDataAvailable = "AmountDataAvailable";

enum class BundleType { System, User };

/// What the platform says about the device, its software and the running process.
class DeviceInformation {
 public:
  using BundleVisitor = std::function<void(std::string_view bundle, BundleType type)>;
  using LanguageTags = std::vector<std::string>;  ///< such as "en-GB", the best first

  virtual ~DeviceInformation() = default;

  /// The answer to a question such as "DiskUsage", if the platform has one.
  virtual std::optional<PropertyValue> OrreryCopyAnswer(std::string_view question) = 0;

  /// True when the answer is the boolean true.
  bool OrreryGetBoolAnswer(std::string_view question) {
    return OrreryCopyAnswer(question) == PropertyValue(true);
  }

  /// The device's identifier; `withDescription` puts a word before it that says what it identifies.
  virtual std::string GetSysIDWithDescription(bool withDescription) = 0;

  virtual std::string GetHardwareModel() = 0;

  /// The running version of the system, as it names itself.
  virtual std::string GetSystemVersion() = 0;

  /// A new identifier for each log.
  virtual std::string GetIncidentID() = 0;

  /// The name of the running program, without its folder.
  virtual std::string processName() = 0;
  virtual std::int32_t processIdentifier() = 0;

  /// Visits every installed bundle once (the platform's bundle-type code 1).
  virtual void EnumerateInstalledBundles(const BundleVisitor& visitor) = 0;

  /// The user's languages, and those that the system is localized for.
  virtual LanguageTags preferredLanguages() = 0;
  virtual LanguageTags systemLocalizations() = 0;

  /// The best of `available` for a user with these preferences.
  virtual LanguageTags bestLocalizations(const LanguageTags& available,
                                         const LanguageTags& preferred) = 0;

  /// The country code of the current locale, if it names one.
  virtual std::optional<std::string> localeCountryCode() = 0;

  /// False on a system without the service that knows how much of a volume could be freed.
  virtual bool reclaimerIsAvailable() = 0;

  /// Bytes by item, for the volume named in `options`; nothing when the service does not answer.
  virtual std::optional<PropertyDict> ReclaimerCopyItemizedPurgeableSpaceWithInfo(
      const PropertyDict& options) = 0;

  /// Loads the crash-report support library; false when it cannot be loaded.
  virtual bool loadSupportLibrary() = 0;

  /// True when the loaded library has the function. It is called through `Preferences`.
  virtual bool supportLibraryOffers(std::string_view symbol) = 0;
};

}  // namespace vesprun
