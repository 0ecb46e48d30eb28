#pragma once

#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// Reads a ptree document that has no comments, character references, carriage returns in texts,
/// byte order mark and the like: as `writePtree` and most others write them, and several times as
/// fast as a whole XML parser. Nothing for any other document, sound or not.
std::optional<PropertyValue> readPlainPtree(std::string_view document);

}  // namespace vesprun
