#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// One byte count of an answer to "DiskUsage" (see `Orrery`) in units of 1,048,576 bytes, rounded
/// down. Nothing when the answer is no dictionary, or holds no number under that name.
std::optional<std::int64_t> diskUsageInMebibytes(const std::optional<PropertyValue>& answer,
                                                 std::string_view name);

}  // namespace vesprun
