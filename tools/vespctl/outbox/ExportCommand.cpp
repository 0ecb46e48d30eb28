#include <cstdint>
#include <limits>

#include "Command.h"
#include "DecimalNumber.h"
#include "common/TextForm.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/device/Pseudonym.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

struct Export {
  std::string directory;
  std::string device;
  std::int32_t from = std::numeric_limits<std::int32_t>::min();
  std::int32_t to = std::numeric_limits<std::int32_t>::max();
};

void run(const Export& wanted) {
  const auto platform = openDevice(wanted.directory);
  const std::string device =
      !wanted.device.empty()
          ? wanted.device
          : pseudonymOf(platform->description().system.systemID.value_or(live::machineIdentifier()),
                        "vesprun exported device");
  const auto print = [&](SubmittedLog&& log) {
    if (log.day < wanted.from || log.day > wanted.to) {
      return;
    }
    const auto entry = [&log](std::string_view key) { return *log.document.find(key); };
    printJson(PropertyDict{{"version", 1},
                           {"device", device},
                           {"day", log.day},
                           {"revision", log.revision},
                           {"created", entry("TBLogCreationDate")},
                           {"whitelist", entry("TBWhitelistDigest")},
                           {"scalars", entry("TBScalars")},
                           {"distributions", entry("TBDistributions")},
                           {"histograms", entry("TBDistributionsHistogram")}});
  };
  const std::vector<UnreadableLog> unreadable = forEachSubmittedLog(platform->directory(), print);
  if (!unreadable.empty()) {
    nameUnreadable(std::span(unreadable).first(unreadable.size() - 1));
    throw CommandFailure(unreadable.back().name + ": " + unreadable.back().why);
  }
}

}  // namespace

void addExportCommand(CLI::App& vespctl) {
  const auto wanted = std::make_shared<Export>();
  CLI::App* command = addDeviceCommand(vespctl, "export",
                                       "Prints each submitted daily log as one line for vespfleet",
                                       wanted->directory);
  command->add_option("--device", wanted->device, "A name instead of the device's pseudonym")
      ->check([](const std::string& name) -> std::string {
        constexpr std::size_t kLongest = 255;
        return !name.empty() && name.size() <= kLongest && isXmlText(name)
                   ? ""
                   : "a device's name has 1 to 255 bytes of text";
      });
  command->add_option("--from", wanted->from, "First day, in days since 1970")
      ->transform(decimal<std::int32_t>());
  command->add_option("--to", wanted->to, "Last day")->transform(decimal<std::int32_t>());
  command->callback([wanted] { run(*wanted); });
}

}  // namespace vesprun
