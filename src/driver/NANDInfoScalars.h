#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

/// Sets a scalar of today for every number of the NAND info, under its key: the number as a signed
/// 64-bit integer, a boolean as 1 or 0. Values of other types are passed over.
///
/// When the info tells of an error ("com.quill.NANDInfo.Error"), a message at the default level is
/// all that comes of it.
void SetNANDInfoScalars(const PropertyDict& info);

}  // namespace vesprun
