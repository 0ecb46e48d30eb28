#include "days/MissingReports.h"

#include <optional>
#include <set>
#include <string_view>

#include "commandline/Program.h"
#include "commandline/Progress.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/OutboxFiles.h"
#include "report/LogSubmission.h"
#include "report/ReportSources.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

/// The days that have a daily log, or had one before it was pruned.
std::set<std::int32_t> reportedDays(const DeviceDirectory& directory,
                                    std::vector<UnreadableLog>& unreadable) {
  std::set<std::int32_t> days;
  unreadable =
      forEachSubmittedLog(directory, [&days](SubmittedLog&& log) { days.insert(log.day); });
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
Submission submitReport(const HostPlatform& device, std::int32_t day, bool isDry) {
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
  const bool isDone =
      isDry ? canSerializeDailyLog(*document) && !device.description().submission.fails
            : submitDailyLog(*document);
  return isDone ? Submission::Done : Submission::Failed;
}

}  // namespace

MissingReports submitMissingReports(HostPlatform& device, std::uint32_t last, bool isDry) {
  const std::int64_t today = device.tallybook().TBDaysSince1970();
  MissingReports reports;
  if (!device.logsmith().DiagnosticLogSubmissionEnabled()) {
    return reports;
  }
  const std::vector<std::int32_t> days =
      missedDays(device.counters(), today - 1 - last, today - 2,
                 reportedDays(device.directory(), reports.unreadable));
  Progress progress("Catching up", "days", days.size());
  for (const std::int32_t day : days) {
    logMessage(LogLevel::Default, "catching up on day %d", day);
    const Submission submission = submitReport(device, day, isDry);
    if (submission == Submission::Done) {
      reports.submitted.push_back(day);
    } else if (submission == Submission::Failed) {
      reports.failed.push_back(day);
    }
    progress.advance();
  }
  return reports;
}

}  // namespace vesprun
