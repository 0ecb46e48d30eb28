#pragma once

#include <array>
#include <cstdint>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

inline constexpr std::array<std::string_view, 6> kHLT_instantaneous_gc_wamp_array{
    "HLT_instantaneous_gc_wamp_0", "HLT_instantaneous_gc_wamp_1", "HLT_instantaneous_gc_wamp_2",
    "HLT_instantaneous_gc_wamp_3", "HLT_instantaneous_gc_wamp_4", "HLT_instantaneous_gc_wamp_5"};

/// The write amplification of garbage collection in each of the last six periods of four hours, the
/// latest first, told from the validity curve at the period's beginning: a double, or the 32-bit
/// number 0 for a period in which nothing was collected, or of which that is not known.
///
/// When the newest snapshot says that there is no stats magazine, the error text as
/// "com.quill.NANDInfo.ErrorMessage" instead. Else empty with `skipHistory` (not 0).
PropertyDict CopySMagNANDFTLCustomHistoryInfo(std::uint32_t skipHistory);

}  // namespace vesprun
