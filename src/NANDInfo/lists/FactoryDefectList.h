#pragma once

#include <cstdint>
#include <span>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// Logs a controller's list of factory defects as structured records of type 176: one with "Factory
/// Count" and, when the controller's properties have it, "com.quill.NANDInfo.nandDesc"; then one
/// for each defect that lies wholly within the buffer. All numbers are signed 32-bit, but for
/// "Temperature", which is signed 8-bit.
///
/// `properties` (may be null or anything but a dictionary) and `className` are the controller's.
/// Always true. A buffer too short for the factory count has nothing to log, one too short for the
/// record count no records.
bool LogFactoryDefectList(std::span<const std::uint8_t> buffer, const PropertyValue* properties,
                          std::string_view className);

}  // namespace vesprun
