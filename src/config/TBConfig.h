#pragma once

#include <tsl/ordered_map.h>

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "common/PropertyDict.h"
#include "config/KeyOptions.h"
#include "config/PrefixTable.h"
#include "config/WhitelistKeyGroup.h"

namespace vesprun {

/// What the whitelist says of a key or prefix.
template <typename Options>
struct WhitelistEntry {
  std::string_view group;          ///< the last one that names it
  std::optional<Options> options;  ///< nothing when they cannot be read: held back
};

/// Keys or prefixes in the order in which they were first named. Texts lie in the document.
template <typename Options>
using WhitelistTable = tsl::ordered_map<std::string_view, WhitelistEntry<Options>>;

enum class DecidedBy { Nothing, Key, Prefix, InternalDevice };

/// How the whitelist decides on a key.
template <typename Options>
struct WhitelistDecision {
  DecidedBy by = DecidedBy::Nothing;
  std::string_view prefix;                         ///< DecidedBy::Prefix
  const WhitelistEntry<Options>* entry = nullptr;  ///< DecidedBy::Key and Prefix

  /// The options with which the key leaves, or null when it stays.
  const Options* options() const {
    static constexpr Options kNoOptions;
    if (by == DecidedBy::InternalDevice) {
      return &kNoOptions;
    }
    return entry != nullptr && entry->options ? &*entry->options : nullptr;
  }
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

  /// The same with the reason, and without debug lines.
  WhitelistDecision<ScalarOptions> decideScalarKey(std::string_view key) const;
  WhitelistDecision<DistributionOptions> decideDistributionKey(std::string_view key) const;

  /// MD5 over the bytes of the whitelist file: 32 lowercase hexadecimal digits.
  const std::string& configFileDigest() const { return _configFileDigest; }

 private:
  explicit TBConfig(PropertyValue document);

  void takeGroup(const WhitelistKeyGroup& group);

  PropertyValue _document;
  WhitelistTable<ScalarOptions> _scalarKeys;
  WhitelistTable<ScalarOptions> _scalarPrefixes;
  WhitelistTable<DistributionOptions> _distributionKeys;
  WhitelistTable<DistributionOptions> _distributionPrefixes;
  PrefixTable _scalarPrefixTable;
  PrefixTable _distributionPrefixTable;
  bool _isInternalDevice = false;
  std::string _configFileDigest;
};

}  // namespace vesprun
