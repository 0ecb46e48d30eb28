#pragma once

#include <cstdint>

#include "config/KeyOptions.h"

namespace vesprun {

/// A scalar as coarse as its options ask for: first the bucket, then the significant digits.
///
/// Bucket interval b: the nearest multiple of b, halves upward, in unsigned 64-bit arithmetic on
/// the value's bits, wrapping; 0 for b = 0.
///
/// Significant digits s: with m = ⌈log10(|v|)⌉ in double precision, v is rounded to a multiple of
/// 10^(m − s), halves away from zero, and saturates at the ends of the range; it stays as it is
/// when it is 0 or m − s, as a signed 64-bit number, is below 1. So does the most negative value,
/// whose magnitude there is no number for.
std::int64_t roundScalar(std::int64_t value, const ScalarOptions& options);

}  // namespace vesprun
