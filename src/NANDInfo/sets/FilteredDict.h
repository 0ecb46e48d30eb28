#pragma once

#include "NANDInfo/tables/FieldTable.h"
#include "common/PropertyDict.h"

namespace vesprun {

/// The entries of `source` whose keys are in `keys`, values unchanged, in the order of `source`.
/// Without a list (null) a copy of the whole source.
PropertyDict CreateFilteredDict(const PropertyDict& source, const FieldTable* keys);

/// The entries of `source` whose keys are in `digits`, in the order of `source`. With `round` each
/// number, read as an unsigned 64-bit integer, is replaced by the unsigned 64-bit integer that
/// keeps the digits the table gives. A boolean is no number; it and every other value stay as they
/// are. Without a table (null) a copy of the whole source, nothing rounded.
PropertyDict CreateFilteredDict_SigDig(const PropertyDict& source, const FieldTable* digits,
                                       bool round);

}  // namespace vesprun
