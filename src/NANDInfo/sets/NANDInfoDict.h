#pragma once

#include "NANDInfo/parsers/ORUStatsContext.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The legacy NAND info (`CopyNANDInfo`) from the base statistics; sums and differences wrap.
/// `omitVersionFields` leaves out the versions and the demo mode.
PropertyDict CreateNANDInfoDict(const ORUStatsContext& context, bool omitVersionFields);

}  // namespace vesprun
