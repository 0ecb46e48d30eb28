#include "outbox/ExportCommand.h"

#include <cstdint>
#include <limits>

#include "Command.h"
#include "Complaints.h"
#include "commandline/Arguments.h"
#include "common/Calendar.h"
#include "common/TextForm.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/device/Pseudonym.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

struct Export {
  std::string device;
  std::optional<GivenDay> from;
  std::optional<GivenDay> to;
};

void run(const Export& wanted) {
  Complaints complaints;
  const auto platform = openDeviceReadOnly(complaints);
  const std::int32_t today = platform->tallybook().TBDaysSince1970();
  const std::int32_t from =
      wanted.from ? wanted.from->on(today) : std::numeric_limits<std::int32_t>::min();
  const std::int32_t to =
      wanted.to ? wanted.to->on(today) : std::numeric_limits<std::int32_t>::max();
  const std::string device =
      !wanted.device.empty()
          ? wanted.device
          : pseudonymOf(platform->description().system.systemID.value_or(live::machineIdentifier()),
                        "vesprun exported device");
  const auto print = [&](SubmittedLog&& log) {
    if (log.day < from || log.day > to) {
      return;
    }
    const auto entry = [&log](std::string_view key) { return *log.document.find(key); };
    printJson({{"version", 1},
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

void addExportCommand(CLI::App& command) {
  const auto wanted = std::make_shared<Export>();
  command.add_option("--device", wanted->device, "A name instead of the device's pseudonym")
      ->type_name("NAME")
      ->check([](const std::string& name) -> std::string {
        constexpr std::size_t kLongest = 255;
        return !name.empty() && name.size() <= kLongest && isXmlText(name)
                   ? ""
                   : "a device's name has 1 to 255 bytes of text";
      });
  addDay(command, "--from", wanted->from, "The first day");
  addDay(command, "--to", wanted->to, "The last day");
  command.callback([wanted] { run(*wanted); });
}

}  // namespace vesprun
