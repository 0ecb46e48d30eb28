#pragma once

#include "NANDInfo/parsers/ORUStatsContext.h"

namespace vesprun {

/// How many 4 KiB blocks are written to flash for each that the host writes, computed in double
/// precision and kept in single. Before the first host write a figure is infinite, or NaN when
/// nothing was erased.
struct WriteAmplification {
  float user = 0.0F;
  float intermediate = 0.0F;  ///< 0 when not known
};

WriteAmplification writeAmplification(const ORUStatsContext& statistics);

/// Is the figure above the threshold? That is the preference "userWAmp" of "com.quill.NANDInfo" if
/// it is a fraction (not an integer) between 0 and 10, both excluded, else 2.
bool isAboveWriteAmplificationThreshold(float userWamp);

}  // namespace vesprun
