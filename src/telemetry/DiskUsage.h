#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// A byte count of an answer to "DiskUsage" (`Orrery`) in MiB, rounded down; nothing without a
/// dictionary or a number of that name.
std::optional<std::int64_t> diskUsageInMebibytes(const std::optional<PropertyValue>& answer,
                                                 std::string_view name);

}  // namespace vesprun
