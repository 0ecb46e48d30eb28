#pragma once

#include <optional>
#include <string_view>

namespace vesprun {

/// The double that a whole text says: a decimal number, with an exponent or without, "inf", "-inf"
/// or "nan". Nothing for any other text and for what a double cannot hold.
std::optional<double> parseReal(std::string_view text);

}  // namespace vesprun
