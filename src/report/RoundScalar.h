#pragma once

#include <cstdint>

#include "config/KeyOptions.h"

namespace vesprun {

/// Rounds a scalar as its options ask: first the bucket, then the significant digits.
///
/// Bucket interval b: the nearest multiple of b, halves upward, in wrapping unsigned 64-bit
/// arithmetic on the value's bits; 0 for b = 0.
///
/// Significant digits s: with m = ⌈log10(|v|)⌉ in double precision, the nearest multiple of
/// 10^(m−s), halves away from zero, saturating; unchanged for 0, for m−s (signed 64-bit) below 1,
/// and for the most negative value, which has no magnitude.
std::int64_t roundScalar(std::int64_t value, const ScalarOptions& options);

}  // namespace vesprun
