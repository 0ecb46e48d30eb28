#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// Appends the padded base64 form, on one line.
void appendBase64(std::span<const std::uint8_t> data, std::string& text);

/// Ignores white space. Nothing for any other character, for wrong padding, and for set bits that
/// belong to no byte.
std::optional<Bytes> parseBase64(std::string_view text);

}  // namespace vesprun
