#pragma once

#include "NANDInfo/parsers/ORUStatsContext.h"

namespace vesprun {

/// How many times over each block of 4 KiB that the host writes is written to the flash. Computed
/// in double precision and kept in single precision. Before the host has written anything a figure
/// is infinite, or NaN when nothing was erased either.
struct WriteAmplification {
  float user = 0.0F;
  float intermediate = 0.0F;  ///< 0 when not known
};

WriteAmplification writeAmplification(const ORUStatsContext& statistics);

/// Is the user partition's figure above the threshold? That is the preference "userWAmp" of
/// "com.quill.NANDInfo" when it is a fraction between 0 and 10, both excluded, else 2. Integers do
/// not count. A figure that is NaN is not above anything.
bool isAboveWriteAmplificationThreshold(float userWamp);

}  // namespace vesprun
