#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

// Options of whitelisted keys. A key with an option of a wrong type must stay out of the log: no
// value may leave finer than was meant.

/// How coarse a scalar is reported: unsigned 64-bit integers, converted as `Number` does.
struct ScalarOptions {
  // Names in the whitelist: a group's lists of such keys and prefixes, and the options.
  static constexpr std::string_view kKeyList = "ScalarKeys";
  static constexpr std::string_view kPrefixList = "ScalarKeyPrefixes";
  static constexpr std::string_view kBucketInterval = "bucket_interval";
  static constexpr std::string_view kSignificantDigits = "sig_fig";

  std::optional<std::uint64_t> bucketInterval;     ///< "bucket_interval"
  std::optional<std::uint64_t> significantDigits;  ///< "sig_fig"

  /// Nothing when an entry is not a number; booleans are not.
  static std::optional<ScalarOptions> read(const PropertyDict& options);

  bool operator==(const ScalarOptions&) const = default;
};

struct DistributionOptions {
  static constexpr std::string_view kKeyList = "DistributionKeys";
  static constexpr std::string_view kPrefixList = "DistributionKeyPrefixes";
  static constexpr std::string_view kIntervals = "intervals";

  const PropertyArray* intervals = nullptr;  ///< "intervals", in the dictionary; null: absent

  /// Nothing when "intervals" is not an array of numbers.
  static std::optional<DistributionOptions> read(const PropertyDict& options);

  /// Whether every value gets the same bucket and label.
  bool operator==(const DistributionOptions& other) const;
};

}  // namespace vesprun
