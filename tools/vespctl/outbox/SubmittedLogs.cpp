#include "outbox/SubmittedLogs.h"

#include "access/CommandDevice.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/device/Pseudonym.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/Files.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {

std::vector<std::string> namesOfLogs(const DeviceDirectory& directory) {
  return *orFail(
      [&](std::string& error) { return namesInFolder(directory.hostPath(kLogFolder), error); });
}

std::vector<UnreadableLog> forEachSubmittedLog(
    const DeviceDirectory& directory, const std::function<void(SubmittedLog&& log)>& take) {
  return *orFail([&](std::string& error) { return forEachDailyLog(directory, take, error); });
}

std::string exportedName(const HostPlatform& device) {
  return pseudonymOf(device.description().system.systemID.value_or(live::machineIdentifier()),
                     "vesprun exported device");
}

void nameUnreadable(std::span<const UnreadableLog> logs) {
  for (const auto& [name, why, wasRead] : logs) {
    complain(name + ": " + why);
  }
}

void failIfUnreadable(std::span<const UnreadableLog> logs) {
  if (!logs.empty()) {
    nameUnreadable(logs.first(logs.size() - 1));
    throw CommandFailure(logs.back().name + ": " + logs.back().why);
  }
}

}  // namespace vesprun
