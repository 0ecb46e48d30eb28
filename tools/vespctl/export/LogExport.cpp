#include "export/LogExport.h"

#include "commandline/Program.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/XmlText.h"
#include "vespfleet/store/ExportedLine.h"

namespace vesprun {

CLI::Option* addDeviceName(CLI::App& command, std::string& name) {
  return command.add_option("--device", name, "A name instead of the device's pseudonym")
      ->type_name("NAME")
      ->check([](const std::string& given) -> std::string {
        constexpr std::size_t kMax = 255;
        return !given.empty() && given.size() <= kMax && isXmlText(given)
                   ? ""
                   : "a device's name has 1 to 255 bytes of text";
      });
}

LogExport::LogExport(HostPlatform& device, const std::string& name)
    : _device(!name.empty() ? name : exportedName(device)), _notes(*orFail([&](std::string& error) {
        return readSubmittedNotes(device.directory(), error);
      })) {}

SubmittedNote LogExport::noteOn(const DailyLog& log) const {
  const auto noted = _notes.find(log.name);
  return noted != _notes.end() ? noted->second : SubmittedNote{};
}

FigureSource LogExport::sourceOf(const DailyLog& log) const {
  const SubmittedNote note = noteOn(log);
  return {_device, log.day, log.revision, note.build, note.model};
}

std::optional<std::string> LogExport::lineOf(const DailyLog& log, std::string& why) const {
  const auto entry = [&log](std::string_view key) { return *log.document.find(key); };
  const SubmittedNote note = noteOn(log);
  std::string line = jsonText({{"version", 2},
                               {"device", _device},
                               {"day", log.day},
                               {"revision", log.revision},
                               {"created", entry("TBLogCreationDate")},
                               {"build", jsonOrNull(note.build)},
                               {"model", jsonOrNull(note.model)},
                               {"whitelist", entry("TBWhitelistDigest")},
                               {"scalars", entry("TBScalars")},
                               {"distributions", entry("TBDistributions")},
                               {"histograms", entry("TBDistributionsHistogram")}});
  if (!parseExportedLine(line, why)) {
    why = "no store would take it: " + why;
    return std::nullopt;
  }
  return line;
}

}  // namespace vesprun
