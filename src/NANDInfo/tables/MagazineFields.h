#pragma once

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

/// The accumulating counters of a stats-magazine snapshot, reported as deltas.
extern const FieldTable PrivacyApprovedSMagNANDFTLCounters_Accum;

/// Its instantaneous values, reported unchanged.
extern const FieldTable PrivacyApprovedSMagNANDFTLCounters_Dynamic;

}  // namespace vesprun
