#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "config/TBConfig.h"
#include "platform/host/documents/JsonForm.h"

namespace vesprun {

/// Why a key leaves the installed device or stays, as `explain --json` prints it. `config` may be
/// null. Nothing when the counters cannot be read.
template <typename Options>
std::optional<Json> explainKey(const TBConfig* config, std::string_view key);

/// The same for people.
void printExplanation(const Json& explanation, bool hasWhitelist);

/// For people: whether a key was ever counted, as any kind, and else the nearest one that was.
std::string whetherCounted(std::string_view key);

}  // namespace vesprun
