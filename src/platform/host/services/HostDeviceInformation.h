#pragma once

#include <unistd.h>

#include <map>
#include <set>

#include "platform/DeviceInformation.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/device/Pseudonym.h"

namespace vesprun {

/// The described answers, or else those of Linux.
class HostDeviceInformation : public DeviceInformation {
 public:
  HostDeviceInformation(const DeviceDescription& description, const DeviceDirectory& directory)
      : _description(description), _directory(directory) {}

  std::optional<PropertyValue> OrreryCopyAnswer(std::string_view question) override {
    const auto& properties = _description.properties;
    if (question == "InternalBuild") {
      return properties.internalBuild;
    }
    if (question == "DiskUsage") {
      return describedOr(properties.diskUsage, [this] { return liveDiskUsage(); });
    }
    return question == "InverseDeviceID" ? properties.inverseDeviceID : std::nullopt;
  }
  std::string GetSysIDWithDescription(bool withDescription) override {
    return (withDescription ? "machine " : "") +
           describedOr(_description.system.systemID, liveSystemIdentifier);
  }
  std::string GetHardwareModel() override {
    return describedOr(_description.system.hardwareModel, live::hardwareModel);
  }
  std::string GetSystemVersion() override {
    return describedOr(_description.system.systemVersion, live::osVersion);
  }
  /// A described identifier is the same for every log.
  std::string GetIncidentID() override {
    return describedOr(_description.system.incidentID, live::newIdentifier);
  }

  /// On the device the job's process is vesprun, whichever program runs it here.
  std::string processName() override { return "vesprun"; }
  std::int32_t processIdentifier() override { return getpid(); }

  void EnumerateInstalledBundles(const BundleVisitor& visitor) override {
    for (const auto& [bundle, user] : describedOr(_description.apps, live::applications)) {
      visitor(bundle, user ? BundleType::User : BundleType::System);
    }
  }

  LanguageTags preferredLanguages() override {
    return describedOr(_description.languages.preferred, live::preferredLanguages);
  }
  LanguageTags systemLocalizations() override {
    return describedOr(_description.languages.localizations, live::localizations);
  }
  /// For each preferred language: the available one of the same tag, else one that the tag begins
  /// with ("en" for "en-GB"), else the first of the same language ("en-US" for "en-GB"). Languages
  /// without a match are skipped.
  LanguageTags bestLocalizations(const LanguageTags& available,
                                 const LanguageTags& preferred) override {
    const AvailableLanguages known(available);
    LanguageTags best;
    std::set<std::string_view> taken;
    for (const std::string& wanted : preferred) {
      const std::optional<std::string_view> found = known.bestFor(wanted);
      if (found && taken.insert(*found).second) {
        best.emplace_back(*found);
      }
    }
    return best;
  }
  std::optional<std::string> localeCountryCode() override {
    return describedOr(_description.languages.country, live::countryCode);
  }

  bool reclaimerIsAvailable() override { return _description.purgeable.has_value(); }
  /// The same for every volume.
  std::optional<PropertyDict> ReclaimerCopyItemizedPurgeableSpaceWithInfo(
      const PropertyDict& /*options*/) override {
    return *_description.purgeable;
  }

  bool loadSupportLibrary() override { return _description.supportLibrary.available; }
  bool supportLibraryOffers(std::string_view symbol) override {
    return !_description.supportLibrary.missing.contains(symbol);
  }

  /// Stands for the machine's identifier and does not hold it.
  static std::string liveSystemIdentifier() {
    const std::string machine = live::machineIdentifier();
    return machine.empty() ? "" : pseudonymOf(machine, "vesprun system");
  }

 private:
  std::optional<PropertyDict> liveDiskUsage() const {
    const std::optional<FileSystemStatistics> volume = live::volume(_directory.path());
    if (!volume) {
      return std::nullopt;
    }
    const auto bytes = [&](std::uint64_t blocks) {
      return static_cast<std::int64_t>(blocks * volume->blockSize);
    };
    return PropertyDict{
        {std::string(kDiskUsageTotalDiskCapacity), bytes(volume->blocks)},
        {std::string(kDiskUsageTotalDataAvailable), bytes(volume->availableBlocks)},
        {std::string(kDiskUsageAmountDataAvailable), bytes(volume->availableBlocks)}};
  }

  /// Ordered: tens of thousands of languages may be described.
  class AvailableLanguages {
   public:
    explicit AvailableLanguages(const LanguageTags& tags) {
      for (const std::string_view tag : tags) {
        _tags.insert(tag);
        _ofLanguage.emplace(languageOf(tag), tag);  // the first one stays
      }
    }

    std::optional<std::string_view> bestFor(std::string_view wanted) const {
      for (std::string_view tag = wanted.substr(0, kMaxTag); !tag.empty();) {
        if (const auto found = _tags.find(tag); found != _tags.end()) {
          return *found;
        }
        const auto end = tag.rfind('-');
        tag = tag.substr(0, end == std::string_view::npos ? 0 : end);
      }
      const auto found = _ofLanguage.find(languageOf(wanted));
      return found != _ofLanguage.end() ? std::optional(found->second) : std::nullopt;
    }

   private:
    static constexpr std::size_t kMaxTag = 255;  ///< longer than any language's

    static std::string_view languageOf(std::string_view tag) {
      return tag.substr(0, tag.find('-'));
    }

    std::set<std::string_view> _tags;
    std::map<std::string_view, std::string_view> _ofLanguage;
  };

  const DeviceDescription& _description;
  const DeviceDirectory& _directory;
};

}  // namespace vesprun
