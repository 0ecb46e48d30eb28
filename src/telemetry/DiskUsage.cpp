#include "telemetry/DiskUsage.h"

namespace vesprun {

std::optional<std::int64_t> diskUsageInMebibytes(const std::optional<PropertyValue>& answer,
                                                 std::string_view name) {
  const PropertyDict* usage = answer ? answer->dict() : nullptr;
  const Number* bytes = usage != nullptr ? usage->findNumber(name) : nullptr;
  return bytes != nullptr ? std::optional(bytes->asInt64() >> 20) : std::nullopt;
}

}  // namespace vesprun
