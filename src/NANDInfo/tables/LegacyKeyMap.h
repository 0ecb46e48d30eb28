#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

/// The base statistics with a key in the legacy NAND info. Names are shorter than 100
/// characters.
extern const FieldTable keyMap;

/// "com.quill.NANDInfo." and a suffix, often the name itself. Nothing for a field outside `keyMap`.
std::optional<std::string> legacyKeyOf(std::string_view field);

}  // namespace vesprun
