#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

// What a whitelist's options dictionary asks for. Options with an entry of the wrong type cannot be
// read, and their key must stay out of the log: no value may go out finer than was meant.

/// How coarse a scalar is reported. Both are read as unsigned 64-bit integers, as `Number`
/// converts; a boolean does not count as a number.
struct ScalarOptions {
  // The whitelist's names: of the lists of such keys and prefixes in a group, and of the options.
  static constexpr std::string_view kKeyList = "ScalarKeys";
  static constexpr std::string_view kPrefixList = "ScalarKeyPrefixes";
  static constexpr std::string_view kBucketInterval = "bucket_interval";
  static constexpr std::string_view kSignificantDigits = "sig_fig";

  std::optional<std::uint64_t> bucketInterval;     ///< "bucket_interval"
  std::optional<std::uint64_t> significantDigits;  ///< "sig_fig"

  /// Nothing when an entry is there but not a number.
  static std::optional<ScalarOptions> read(const PropertyDict& options);

  bool operator==(const ScalarOptions&) const = default;
};

struct DistributionOptions {
  static constexpr std::string_view kKeyList = "DistributionKeys";
  static constexpr std::string_view kPrefixList = "DistributionKeyPrefixes";
  static constexpr std::string_view kIntervals = "intervals";

  const PropertyArray* intervals = nullptr;  ///< "intervals", in the dictionary; null: absent

  /// Nothing when "intervals" is there but not an array of numbers.
  static std::optional<DistributionOptions> read(const PropertyDict& options);

  /// Whether all values get the same bucket and label.
  bool operator==(const DistributionOptions& other) const;
};

}  // namespace vesprun
