#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "config/KeyOptions.h"
#include "config/WhitelistKeyGroup.h"
#include "config/WhitelistTable.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// A group that names the key but is disabled on this device.
struct PassedOverGroup {
  std::string_view name;
  WhitelistKeyGroup::Standing standing;
  DecidedBy by;  ///< Key or Prefix
};

/// The whitelist: which counters the daily log may carry, and with which options.
///
/// A ptree document: a dictionary of groups, each with the tables "ScalarKeys",
/// "ScalarKeyPrefixes", "DistributionKeys" and "DistributionKeyPrefixes" from key or prefix to
/// options. Groups are taken in document order; a key or prefix named again keeps its place and
/// takes the later options.
///
/// Groups and tables that are not dictionaries are skipped with an error line. A key or prefix with
/// unreadable options is held back, even on an internal device or from a prefix; each table gets
/// one error line, with the number of them and the first. So does each with options that nothing
/// reads, which leave a value as exact as if they were not there. A file above 256 MiB is not read.
class TBConfig {
 public:
  /// Where a device has its whitelist.
  static constexpr std::string_view kFolder = "/Library/Application Support/Tallybook";
  static constexpr std::string_view kFile = "Whitelist_Stagebox.ptree";
  static std::string path() { return std::string(kFolder).append("/").append(kFile); }

  /// From the whitelist file, or the bytes of one. Null, with an error line, when it cannot be read
  /// or parsed.
  static std::unique_ptr<TBConfig> init();
  static std::unique_ptr<TBConfig> fromBytes(std::string_view bytes);

  /// The options of the exact key, else of the first prefix in table order; null when the key must
  /// be left out. An internal device has empty options for a key that is named nowhere. Valid as
  /// long as the configuration.
  const ScalarOptions* configOptionsForScalarKey(std::string_view key) const;
  const DistributionOptions* configOptionsForDistributionKey(std::string_view key) const;

  // For both kinds, `ScalarOptions` and `DistributionOptions`:

  /// The same decision with its reason, without debug lines.
  template <typename Options>
  WhitelistDecision<Options> decide(std::string_view key) const {
    WhitelistDecision<Options> decision = _tables.of<Options>().decide(key);
    if (decision.by == DecidedBy::Nothing && _isInternalDevice) {
      decision.by = DecidedBy::InternalDevice;
    }
    return decision;
  }

  /// The groups, in document order, that are disabled on this device although their lists of that
  /// kind name the key, or else a prefix of it.
  template <typename Options>
  std::vector<PassedOverGroup> groupsPassedOver(std::string_view key) const;

  /// The keys and prefixes of the groups that count on this device.
  const WhitelistTables& tables() const { return _tables; }

  /// MD5 of the file: 32 lowercase hexadecimal digits.
  const std::string& configFileDigest() const { return _configFileDigest; }

 private:
  explicit TBConfig(PropertyValue document);

  void takeGroup(const WhitelistKeyGroup& group);

  PropertyValue _document;
  WhitelistTables _tables;
  bool _isInternalDevice = false;
  std::string _configFileDigest;
};

}  // namespace vesprun
