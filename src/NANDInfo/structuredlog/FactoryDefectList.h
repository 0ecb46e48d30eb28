#pragma once

#include <cstdint>
#include <span>
#include <string_view>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// Logs factory defects: a record with "Factory Count" and, if `properties` (may be null) have it,
/// "com.quill.NANDInfo.nandDesc"; then one for each defect wholly in the buffer. Numbers are signed
/// 32-bit, "Temperature" signed 8-bit. Always true.
bool LogFactoryDefectList(std::span<const std::uint8_t> buffer, const PropertyValue* properties,
                          std::string_view className);

}  // namespace vesprun
