#pragma once

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

/// 731: the counters of a stats-magazine snapshot that accumulate, reported as deltas.
extern const FieldTable PrivacyApprovedSMagNANDFTLCounters_Accum;

/// 41: the values of a stats-magazine snapshot that are instantaneous, reported as they stand.
extern const FieldTable PrivacyApprovedSMagNANDFTLCounters_Dynamic;

}  // namespace vesprun
