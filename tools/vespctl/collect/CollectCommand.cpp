#include "collect/CollectCommand.h"

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/figures/Collection.h"

namespace vesprun {
namespace {

void collect(const std::string& root) {
  if (!root.empty()) {  // a folder that is missing would be a system without figures
    orFail([&](std::string& error) { return DeviceDirectory::open(root, error); });
  }
  const std::unique_ptr<HostPlatform> device = openDevice();
  Complaints complaints(&device->systemLog());
  HostTallybook counters(device->directory(), device->clock(), device->preferences(), complaints);
  std::vector<std::string> leftOut;
  std::string error;
  const auto work = [&](CounterStore& store) {
    leftOut = collectFigures(store, root, device->clock().now());
    return true;
  };
  if (!counters.write(work, error)) {
    complaints.fail(error);
  }
  complaints.print();
  for (const std::string& line : leftOut) {
    device->systemLog().write(LogLevel::Default, line);
  }
}

}  // namespace

void addCollectCommand(CLI::App& command) {
  const auto root = std::make_shared<std::string>();
  command.add_option("--root", *root, "The folder that holds proc and sys, instead of /")
      ->type_name("DIR");
  command.callback([root] { collect(*root); });
}

}  // namespace vesprun
