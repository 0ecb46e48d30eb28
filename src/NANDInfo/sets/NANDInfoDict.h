#pragma once

#include "NANDInfo/parsers/ORUStatsContext.h"
#include "common/PropertyDict.h"

namespace vesprun {

/// The legacy NAND info (see `CopyNANDInfo`) from the base statistics; sums and differences wrap.
/// `omitVersionFields` leaves out the two versions and the demo mode.
PropertyDict CreateNANDInfoDict(const ORUStatsContext& context, bool omitVersionFields);

}  // namespace vesprun
