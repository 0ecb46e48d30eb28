#pragma once

#include <memory>
#include <string>
#include <string_view>

#include "common/PropertyDict.h"
#include "config/PrefixTable.h"

namespace vesprun {

/// The whitelist: which counter keys the daily log may carry, and with which options.
///
/// The file is a ptree document: a dictionary of groups, each a dictionary in which "ScalarKeys",
/// "ScalarKeyPrefixes", "DistributionKeys" and "DistributionKeyPrefixes" are tables of key or
/// prefix to options dictionary (`KeyOptions.h`). The groups are taken in document order, and a key
/// or prefix that is named again takes the later options. The group "InternalTesting" counts only
/// on internal devices; there every group counts. On other devices a group is left out when the
/// preference under its name in "com.quill.da" is there and false.
///
/// What has another shape: a root that is no dictionary fails as a document that does not parse. A
/// group or table that is none is skipped, with an error line that names it. A key or prefix whose
/// options are no dictionary or cannot be read is held back: no look-up answers it, not even on an
/// internal device or through a prefix, so that no value goes out finer than was meant; each table
/// gets one error line for all of them, which names the first. A file above 256 MiB is not read.
class TBConfig {
 public:
  /// Reads the whitelist file. Null, with an error line in the system log, when it cannot be read
  /// or parsed.
  static std::unique_ptr<TBConfig> init();

  /// The options for a key, those of the exact key before those of the first prefix in table order;
  /// null when the key must be left out. On an internal device a key that is named nowhere has
  /// empty options. The dictionary is the configuration's.
  const PropertyDict* configOptionsForScalarKey(std::string_view key) const;
  const PropertyDict* configOptionsForDistributionKey(std::string_view key) const;

  /// MD5 over the bytes of the whitelist file: 32 lowercase hexadecimal digits.
  const std::string& configFileDigest() const { return _configFileDigest; }

 private:
  TBConfig() = default;

  const PropertyDict* optionsForKey(std::string_view key, const PropertyDict& exactKeys,
                                    const PrefixTable& prefixes) const;

  PropertyDict _scalarKeys;
  PrefixTable _scalarPrefixes;
  PropertyDict _distributionKeys;
  PrefixTable _distributionPrefixes;
  bool _isInternalDevice = false;
  std::string _configFileDigest;
};

}  // namespace vesprun
