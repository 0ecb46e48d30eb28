#pragma once

#include <array>
#include <string_view>

#include "vesprun.h"

namespace vesprun {

inline constexpr std::array<std::string_view, 6> kHLT_instantaneous_gc_wamp_array{
    "HLT_instantaneous_gc_wamp_0", "HLT_instantaneous_gc_wamp_1", "HLT_instantaneous_gc_wamp_2",
    "HLT_instantaneous_gc_wamp_3", "HLT_instantaneous_gc_wamp_4", "HLT_instantaneous_gc_wamp_5"};

}  // namespace vesprun
