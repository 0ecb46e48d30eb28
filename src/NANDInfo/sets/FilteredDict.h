#pragma once

#include <cstdint>

#include "NANDInfo/parsers/GenericParserCxt.h"
#include "NANDInfo/tables/FieldTable.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// `x` rounded half up to `sig` significant digits. Digits are counted by log10 in double
/// precision, so a number just below a large power of ten has one digit more. A number that would
/// lose 19 digits becomes 0; results of 2^64 or more wrap.
std::uint64_t roundSig(std::uint64_t x, std::uint64_t sig);

/// The entries of `source` that `keys` lists, in the order of `source`. Null lists all.
PropertyDict CreateFilteredDict(const PropertyDict& source, const FieldTable* keys);

/// The same; with `round`, numbers are read as unsigned 64-bit integers and keep the digits that
/// the table gives.
PropertyDict CreateFilteredDict_SigDig(const PropertyDict& source, const FieldTable* digits,
                                       bool round);
/// The same, straight from a parser's fields, without a dictionary of all of them in between.
PropertyDict CreateFilteredDict_SigDig(const GenericParserCxt& source, const FieldTable* digits,
                                       bool round);

}  // namespace vesprun
