#include "Command.h"
#include "Complaints.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/figures/Collection.h"

namespace vesprun {
namespace {

void collect(const std::string& path, const std::string& root) {
  if (!root.empty()) {
    openDirectory(root);  // a folder that is missing would be a system without figures
  }
  const std::unique_ptr<HostPlatform> device = openDevice(path);
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

void addCollectCommand(CLI::App& vespctl) {
  struct Arguments {
    std::string directory;
    std::string root;
  };
  const auto arguments = std::make_shared<Arguments>();
  CLI::App* command = addDeviceCommand(
      vespctl, "collect", "Counts what the running system's figures have grown since the last time",
      arguments->directory);
  command->add_option("--root", arguments->root,
                      "The folder that holds proc and sys, instead of /");
  command->callback([arguments] { collect(arguments->directory, arguments->root); });
}

}  // namespace vesprun
