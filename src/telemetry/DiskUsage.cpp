#include "telemetry/DiskUsage.h"

namespace vesprun {

std::optional<std::int64_t> diskUsageInMebibytes(const std::optional<PropertyValue>& answer,
                                                 std::string_view name) {
  const PropertyDict* usage = answer ? answer->dict() : nullptr;
  const PropertyValue* bytes = usage != nullptr ? usage->find(name) : nullptr;
  if (bytes == nullptr || bytes->number() == nullptr) {
    return std::nullopt;
  }
  return bytes->number()->asInt64() >> 20;
}

}  // namespace vesprun
