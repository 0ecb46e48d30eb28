#pragma once

#include <optional>
#include <string_view>

#include "common/Number.h"

namespace vesprun {

/// The integer that the whole text denotes: decimal digits, with a minus or without; signed if it
/// fits. Nothing for anything else or beyond 64 bits.
std::optional<Number> parseInteger(std::string_view text);

/// The double that the whole text denotes: a decimal number, "inf", "-inf" or "nan". Nothing for
/// anything else or when a double cannot hold it.
std::optional<double> parseReal(std::string_view text);

}  // namespace vesprun
