#pragma once

#include <cstdint>

#include "NANDInfo/tables/FieldTable.h"
#include "common/PropertyDict.h"

namespace vesprun {

/// `x` rounded half up to `sig` significant decimal digits. The digits are counted through the
/// base-ten logarithm in double precision, so a number just below a power of ten that a double
/// cannot hold counts one digit more. Nothing is left of a number that would lose 19 digits: the
/// result is 0. A result of 2^64 or more wraps, as unsigned 64-bit arithmetic does.
std::uint64_t roundSig(std::uint64_t x, std::uint64_t sig);

/// The entries of `source` whose keys are in `keys`, values unchanged, in the order of `source`.
/// Without a list (null) a copy of the whole source.
PropertyDict CreateFilteredDict(const PropertyDict& source, const FieldTable* keys);

/// The entries of `source` whose keys are in `digits`, in the order of `source`. With `round` each
/// number, read as an unsigned 64-bit integer, is replaced by the unsigned 64-bit integer that
/// keeps the digits the table gives. Every other value, booleans included, stays as it is. Without
/// a table (null) a copy of the whole source, nothing rounded.
PropertyDict CreateFilteredDict_SigDig(const PropertyDict& source, const FieldTable* digits,
                                       bool round);

}  // namespace vesprun
