#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "vesprun/PropertyDict.h"

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

  static bool isRead(std::string_view name) {
    return name == kBucketInterval || name == kSignificantDigits;
  }

  /// Nothing when an entry is not a number; booleans are not.
  static std::optional<ScalarOptions> read(const PropertyDict& options);

  bool operator==(const ScalarOptions&) const = default;
  bool isSameAs(const ScalarOptions& other) const { return *this == other; }
};

struct DistributionOptions {
  static constexpr std::string_view kKeyList = "DistributionKeys";
  static constexpr std::string_view kPrefixList = "DistributionKeyPrefixes";
  static constexpr std::string_view kIntervals = "intervals";

  const PropertyArray* intervals = nullptr;  ///< "intervals", in the dictionary; null: absent

  static bool isRead(std::string_view name) { return name == kIntervals; }

  /// Nothing when "intervals" is not an array of numbers.
  static std::optional<DistributionOptions> read(const PropertyDict& options);

  /// Boundaries compare by value, in their order; NaN equals NaN.
  bool operator==(const DistributionOptions& other) const;
  /// Equal boundaries can be written in two ways, 1 and 1.0.
  bool isSameAs(const DistributionOptions& other) const { return intervals == other.intervals; }
};

/// Who wants an entry, why and until when. The report does not read it.
struct EntryMetadata {
  static constexpr std::string_view kOwner = "owner";
  static constexpr std::string_view kReason = "reason";
  static constexpr std::string_view kExpires = "expires";
  /// A group's dictionary of the three, for its entries that do not say otherwise.
  static constexpr std::string_view kAbout = "About";

  static bool isName(std::string_view name) {
    return name == kOwner || name == kReason || name == kExpires;
  }

  const std::string* owner = nullptr;
  const std::string* reason = nullptr;
  const Date* expires = nullptr;

  /// Those of the options as written, else those of "About"; both may be null. What is not of its
  /// kind counts as absent.
  static EntryMetadata read(const PropertyDict* options, const PropertyDict* about);
};

/// The first option that nothing reads in a list of that kind, or null.
template <typename Options>
const std::string* unreadOption(const PropertyDict& options) {
  for (const auto& [name, value] : options) {
    if (!Options::isRead(name) && !EntryMetadata::isName(name)) {
      return &name;
    }
  }
  return nullptr;
}

}  // namespace vesprun
