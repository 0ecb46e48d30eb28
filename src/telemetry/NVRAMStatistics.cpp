#include "telemetry/NVRAMStatistics.h"

#include <iterator>
#include <optional>
#include <string_view>

#include "platform/Platform.h"
#include "platform/RegistryObject.h"

namespace vesprun {
namespace {

constexpr const char* kNVRAMServiceClass = "DevRegDTNVRAMDiags";
constexpr std::string_view kNVRAMEvent = "com.quill.massStorage.NANDInfo.NORWrites";

struct NVRAMStatistic {
  const char* property;
  std::string_view key;
};

constexpr NVRAMStatistic kNVRAMStatistics[] = {{"CommonUsed", "commonused"},
                                               {"SystemUsed", "systemused"},
                                               {"Generation", "norwrites"},
                                               {"Version", "version"}};

PropertyDict readNVRAMStatistics() {
  PropertyDict statistics;
  DeviceRegistry& registry = platform().deviceRegistry();
  const RegistryObject service(registry.DevRegServiceGetMatchingService(kNVRAMServiceClass));
  if (!service) {
    return statistics;
  }
  statistics.reserve(std::size(kNVRAMStatistics));
  for (const auto& [property, key] : kNVRAMStatistics) {
    std::optional<PropertyValue> value = registry.DevRegRegistryEntrySearchProperty(
        service.get(), property, DeviceRegistry::SearchDirection::Children);
    if (value) {
      statistics.set(key, *std::move(value));
    }
  }
  return statistics;
}

}  // namespace

PropertyDict gatherNVRAMStats() {
  PropertyDict statistics = readNVRAMStatistics();
  if (!statistics.empty()) {
    platform().eventHub().EventHubSendEventLazy(kNVRAMEvent, [statistics] { return statistics; });
  }
  return statistics;
}

}  // namespace vesprun
