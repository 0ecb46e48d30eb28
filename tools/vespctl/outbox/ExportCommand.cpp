#include "outbox/ExportCommand.h"

#include <cstdint>
#include <iostream>
#include <limits>

#include "Command.h"
#include "Complaints.h"
#include "commandline/Arguments.h"
#include "common/Calendar.h"
#include "common/TextForm.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/XmlText.h"
#include "platform/host/outbox/LogNotes.h"
#include "vespfleet/ExportedLine.h"

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
  const std::string device = !wanted.device.empty() ? wanted.device : exportedName(*platform);
  const auto notes =
      orFail([&](std::string& error) { return readSubmittedNotes(platform->directory(), error); });
  std::vector<UnreadableLog> refused;
  const auto print = [&](SubmittedLog&& log) {
    if (log.day < from || log.day > to) {
      return;
    }
    const auto entry = [&log](std::string_view key) { return *log.document.find(key); };
    const auto noted = notes->find(log.name);
    const SubmittedNote note = noted != notes->end() ? noted->second : SubmittedNote{};
    const auto orNull = [](const std::optional<std::string>& text) {
      return text ? Json(*text) : Json(nullptr);
    };
    const std::string line = jsonText({{"version", 2},
                                       {"device", device},
                                       {"day", log.day},
                                       {"revision", log.revision},
                                       {"created", entry("TBLogCreationDate")},
                                       {"build", orNull(note.build)},
                                       {"model", orNull(note.model)},
                                       {"whitelist", entry("TBWhitelistDigest")},
                                       {"scalars", entry("TBScalars")},
                                       {"distributions", entry("TBDistributions")},
                                       {"histograms", entry("TBDistributionsHistogram")}});
    std::string why;
    if (parseExportedLine(line, why)) {
      std::cout << line << '\n';
    } else {
      refused.push_back({log.name, "no store would take it: " + why, true});
    }
  };
  std::vector<UnreadableLog> unreadable = forEachSubmittedLog(platform->directory(), print);
  unreadable.insert(unreadable.end(), refused.begin(), refused.end());
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
        constexpr std::size_t kMax = 255;
        return !name.empty() && name.size() <= kMax && isXmlText(name)
                   ? ""
                   : "a device's name has 1 to 255 bytes of text";
      });
  addDay(command, "--from", wanted->from, "The first day");
  addDay(command, "--to", wanted->to, "The last day");
  command.callback([wanted] { run(*wanted); });
}

}  // namespace vesprun
