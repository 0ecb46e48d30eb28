#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// Appends the base64 form of the bytes, padded, on one line.
void appendBase64(std::span<const std::uint8_t> data, std::string& text);

/// The bytes of a base64 text; white space in it is ignored. Nothing for any other character, for
/// padding that is missing or misplaced, and for bits in the last character that no byte takes.
std::optional<Bytes> parseBase64(std::string_view text);

}  // namespace vesprun
