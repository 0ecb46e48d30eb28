#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "common/PropertyDict.h"
#include "config/KeyOptions.h"
#include "config/WhitelistKeyGroup.h"
#include "config/WhitelistTable.h"

namespace vesprun {

/// A group that does not count on this device although it names a key.
struct PassedOverGroup {
  std::string_view name;
  WhitelistKeyGroup::Standing standing;
  DecidedBy by;  ///< Key or Prefix
};

/// The whitelist: which counter keys the daily log may carry, and with which options.
///
/// The file is a ptree document: a dictionary of groups, each a dictionary in which "ScalarKeys",
/// "ScalarKeyPrefixes", "DistributionKeys" and "DistributionKeyPrefixes" are tables of key or
/// prefix to options dictionary. The groups that count are taken in document order, and a key or
/// prefix that is named again takes the later options in its earlier place.
///
/// A group or table that is not a dictionary is skipped, with an error line that names it. A key or
/// prefix whose options cannot be read is held back: no look-up answers it, not even on an internal
/// device or through a prefix. Each table gets one error line for all of them, which names the
/// first. A file above 256 MiB is not read.
class TBConfig {
 public:
  /// Reads the whitelist file. Null, with an error line in the system log, when it cannot be read
  /// or parsed; so for `fromBytes`.
  static std::unique_ptr<TBConfig> init();
  static std::unique_ptr<TBConfig> fromBytes(std::string_view bytes);

  /// The options for a key, those of the exact key before those of the first prefix in table order;
  /// null when the key must be left out. On an internal device a key that is named nowhere has
  /// empty options. Valid as long as the configuration.
  const ScalarOptions* configOptionsForScalarKey(std::string_view key) const;
  const DistributionOptions* configOptionsForDistributionKey(std::string_view key) const;

  // For both kinds, `ScalarOptions` and `DistributionOptions`:

  /// The same with the reason, and without debug lines.
  template <typename Options>
  WhitelistDecision<Options> decide(std::string_view key) const;

  /// The groups, in document order, that do not count on this device although their lists of that
  /// kind name the key, or else a prefix of it.
  template <typename Options>
  std::vector<PassedOverGroup> groupsPassedOver(std::string_view key) const;

  /// MD5 over the bytes of the whitelist file: 32 lowercase hexadecimal digits.
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
