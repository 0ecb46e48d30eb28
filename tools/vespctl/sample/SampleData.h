#pragma once

#include <nlohmann/json.hpp>

namespace vesprun {

/// What a sample device is made of, as sample.json has it: the whitelist, entries of its
/// description, and the figures behind the controller's statistics, by field name. A figure is an
/// array of elements, or one number, or {"start": a, "step": b, "per": c} for
/// (a + b * n) / c, where n is the hours in use or the number of the MSP; a is 0 and c 1 when they
/// are left out. One number for a statistic of several elements is their sum.
///
/// The whitelist's group InternalTesting counts on an internal device only; a tasking, or
/// `prefs set com.quill.da Experiment false`, switches the group Experiment off.
const nlohmann::ordered_json& sampleData();

}  // namespace vesprun
