#pragma once

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

/// 731: the accumulating counters of a stats-magazine snapshot, reported as deltas.
extern const FieldTable PrivacyApprovedSMagNANDFTLCounters_Accum;

/// 41: its instantaneous values, reported unchanged.
extern const FieldTable PrivacyApprovedSMagNANDFTLCounters_Dynamic;

}  // namespace vesprun
