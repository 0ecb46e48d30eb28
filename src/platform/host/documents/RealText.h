#pragma once

#include <optional>
#include <string_view>

namespace vesprun {

/// The double that the whole text denotes: a decimal number, "inf", "-inf" or "nan". Nothing for
/// anything else or when a double cannot hold it.
std::optional<double> parseReal(std::string_view text);

}  // namespace vesprun
