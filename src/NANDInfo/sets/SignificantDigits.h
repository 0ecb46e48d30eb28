#pragma once

#include <cstdint>

namespace vesprun {

/// `x` rounded half up to `sig` significant decimal digits. The digits are counted through the
/// base-ten logarithm in double precision, so a number just below a power of ten that a double
/// cannot hold counts one digit more. Nothing is left of a number that would lose 19 digits: the
/// result is 0. A result of 2^64 or more wraps, as unsigned 64-bit arithmetic does.
std::uint64_t roundSig(std::uint64_t x, std::uint64_t sig);

}  // namespace vesprun
