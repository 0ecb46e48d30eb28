#include "days/CatchUpCommand.h"

#include <cstdint>
#include <optional>
#include <set>
#include <string>

#include "Command.h"
#include "commandline/Arguments.h"
#include "outbox/SubmittedLogs.h"
#include "platform/Platform.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/OutboxFiles.h"
#include "report/LogSubmission.h"
#include "report/ReportSources.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

/// The days that have a daily log, or had one before it was pruned.
std::set<std::int32_t> reportedDays(const DeviceDirectory& directory) {
  std::set<std::int32_t> days;
  nameUnreadable(
      forEachSubmittedLog(directory, [&days](SubmittedLog&& log) { days.insert(log.day); }));
  const auto pruned =
      orFail([&](std::string& error) { return readLogNotes(directory, kPrunedFile, error); });
  for (const LogNote& log : *pruned) {
    days.insert(log.day);
  }
  return days;
}

/// The days from `first` to `last` that have a row and are not among `reported`.
std::vector<std::int32_t> missedDays(HostTallybook& counters, std::int64_t first, std::int64_t last,
                                     const std::set<std::int32_t>& reported) {
  std::vector<std::int32_t> days;
  const auto find = [&](CounterStore& store) {
    std::optional<std::int32_t> day = store.nextDay(first - 1);
    for (; day && *day <= last; day = store.nextDay(*day)) {
      if (!reported.contains(*day)) {
        days.push_back(*day);
      }
    }
  };
  orFail([&](std::string& error) { return counters.read(find, error); });
  return days;
}

enum class Submission { Done, Empty, Failed };

/// Submits what the next day's run would have submitted, without the keys that it would have
/// measured at that moment.
Submission submitReport(std::int32_t day) {
  logMessage(LogLevel::Default, "catching up on day %d", day);
  TBReport report;
  if (!report.readHistory(day)) {
    return Submission::Failed;
  }
  std::optional<PropertyDict> document = report.makeDocument(day, TBReport::SideEffects::LeftOut);
  if (!document) {
    return Submission::Empty;
  }
  PropertyDict scalars = *document->find("TBScalars")->dict();
  for (const std::string_view key : ownScalarKeys()) {
    scalars.remove(key);
  }
  document->set("TBScalars", std::move(scalars));
  return submitDailyLog(*document) ? Submission::Done : Submission::Failed;
}

void catchUp(std::uint32_t last) {
  const auto device = openDevice();
  const InstalledPlatform installed(*device);
  const FileDescriptor lock = takeDailyWork(device->directory());
  const std::int64_t today = device->tallybook().TBDaysSince1970();
  PropertyArray submitted;
  std::string failed;
  if (device->logsmith().DiagnosticLogSubmissionEnabled()) {
    for (const std::int32_t day : missedDays(device->counters(), today - 1 - last, today - 2,
                                             reportedDays(device->directory()))) {
      const Submission submission = submitReport(day);
      if (submission == Submission::Done) {
        submitted.emplace_back(day);
      } else if (submission == Submission::Failed) {
        failed += (failed.empty() ? "" : ", ") + std::to_string(day);
      }
    }
  }
  printResult(PropertyValue(submitted), [&submitted] {
    if (submitted.empty()) {
      printText("No report was missing.");
    }
    for (const PropertyValue& day : submitted) {
      printText("Submitted the report of " + dateOfDay(day.number()->asInt32()) + ".");
    }
  });
  if (!failed.empty()) {
    throw CommandFailure("not submitted: " + failed + "; the system log says why");
  }
}

}  // namespace

void addCatchUpCommand(CLI::App& command) {
  const auto last = std::make_shared<std::uint32_t>(7);
  command.add_option("--last", *last, "How many days, the day before yesterday the last")
      ->type_name("N")
      ->transform(decimal<std::uint32_t>());
  command.callback([last] { catchUp(*last); });
}

}  // namespace vesprun
