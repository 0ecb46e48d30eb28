#pragma once

#include <cstdint>
#include <optional>

#include "common/PropertyDict.h"

namespace vesprun {

// What a whitelist's options dictionary asks for. An entry of the wrong type cannot be read, and
// the key must then stay out of the log: it must not leave the device finer than was meant.

/// How coarse a scalar is reported. Both are read as unsigned 64-bit integers, as `Number`
/// converts; a boolean is no number.
struct ScalarOptions {
  std::optional<std::uint64_t> bucketInterval;     ///< "bucket_interval"
  std::optional<std::uint64_t> significantDigits;  ///< "sig_fig"
};

/// Nothing when an entry that is there is no number.
std::optional<ScalarOptions> readScalarOptions(const PropertyDict& options);

struct DistributionOptions {
  const PropertyArray* intervals = nullptr;  ///< "intervals", in the dictionary; null: absent
};

/// Nothing when "intervals" is there and is no array of numbers.
std::optional<DistributionOptions> readDistributionOptions(const PropertyDict& options);

}  // namespace vesprun
