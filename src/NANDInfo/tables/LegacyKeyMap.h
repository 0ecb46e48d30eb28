#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

/// 709: the fields of the base statistics that have a key in the legacy NAND info. Every name is
/// shorter than 100 characters.
extern const FieldTable keyMap;

/// The legacy NAND info key of a field of the base statistics: "com.quill.NANDInfo." and a suffix,
/// often the name itself. Nothing when the field is not in `keyMap`.
std::optional<std::string> legacyKeyOf(std::string_view field);

}  // namespace vesprun
