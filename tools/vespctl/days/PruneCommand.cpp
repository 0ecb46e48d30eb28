#include "days/PruneCommand.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "commandline/Arguments.h"
#include "commandline/Progress.h"
#include "common/Calendar.h"
#include "export/UploadCommand.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/outbox/DailyLogs.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/LogPruning.h"
#include "platform/host/outbox/OutboxFiles.h"
#include "platform/host/outbox/PruneDays.h"

namespace vesprun {
namespace {

struct Pruning {
  std::optional<std::uint32_t> counterDays;
  std::optional<std::uint32_t> outboxDays;
  std::optional<std::uint64_t> outboxMebibytes;
  bool isNow = false;
  bool isDry = false;
};

/// Removes the counters of days before `day`. What cannot be done goes into `problems`.
CounterStore::Rows removeCounters(HostPlatform& device, std::int64_t day, bool isDry,
                                  std::vector<std::string>& problems) {
  constexpr std::int64_t kBeforeAllDays = std::numeric_limits<std::int64_t>::min();
  Complaints complaints(&device.systemLog());
  HostTallybook counters(device.directory(), device.clock(), device.preferences(), complaints);
  CounterStore::Rows rows;
  std::optional<std::int32_t> first;
  std::string error;
  const auto look = [&](CounterStore& store) {
    first = store.nextDay(kBeforeAllDays);
    if (isDry) {
      rows = store.rowsBefore(day);
    }
  };
  const auto remove = [&](CounterStore& store) {
    rows = store.rowsBefore(day);
    Progress progress("Removing counters", "days", rows.days.size());
    for (const std::int32_t old : rows.days) {
      store.removeDay(old);
      progress.advance();
    }
    store.returnFreeSpace();
    return true;
  };
  // A write without anything to remove would still lock the database, or even make it.
  if (!counters.read(look, error) ||
      (!isDry && first && *first < day && !counters.write(remove, error))) {
    problems.push_back(error);
  }
  if (!isDry && !removeOldDamaged(
                    device.directory(),
                    startOfDay(static_cast<std::int32_t>(std::max<std::int64_t>(day, 0))), error)) {
    problems.push_back(error);
  }
  complaints.print();
  return rows;
}

/// How many of the removed daily logs no upload has acknowledged; nothing where none was tried.
std::optional<std::size_t> neverUploaded(const DeviceDirectory& directory,
                                         const std::vector<std::string>& removed) {
  std::string ignored;
  if (!directory.hostPath(kUploadLock).status() && !directory.hostPath(kUploadedFile).status()) {
    return std::nullopt;
  }
  std::set<std::string> uploaded;
  for (const LogNote& note :
       readLogNotes(directory, kUploadedFile, ignored).value_or(std::vector<LogNote>())) {
    uploaded.insert(note.name);
  }
  return static_cast<std::size_t>(std::ranges::count_if(removed, [&](const std::string& name) {
    return isDailyLogName(name) && !uploaded.contains(name);
  }));
}

void printRemoved(const CounterStore::Rows& counters, const std::vector<std::string>& logs,
                  const PropertyDict& lines) {
  if (!counters.days.empty()) {
    printText("Counters of " + dateOfDay(counters.days.front()) + " to " +
              dateOfDay(counters.days.back()) + ": " + std::to_string(counters.scalars) +
              " scalars and " + std::to_string(counters.distributions) + " distributions.");
  }
  for (const std::string& log : logs) {
    printText("Log " + log);
  }
  for (const auto& [file, count] : lines) {
    printText(std::string(file) + ": " + std::to_string(count.number()->asUInt64()) + " lines");
  }
  if (counters.days.empty() && logs.empty() && lines.empty()) {
    printText("Nothing was old enough to go.");
  }
}

void prune(const Pruning& wanted) {
  // Today's and tomorrow's reports read these days.
  constexpr std::int64_t kDaysKept = 2;
  constexpr std::uint64_t kBytesPerMebibyte = 1048576;
  Complaints seen;
  const auto device = wanted.isDry ? openDeviceReadOnly(seen) : openDevice();
  const DeviceDirectory& directory = device->directory();
  const FileDescriptor lock = takeDailyWork(directory);
  const Date now = device->clock().now();
  const std::int64_t today = daysSince1970(now);
  std::vector<std::string> problems;
  Progress progress("Pruning", "logs read or removed");
  LogPruning logs(directory, now, [&progress] { progress.advance(); });
  CounterStore::Rows counters;
  const bool isWanted = wanted.counterDays || wanted.outboxDays || wanted.outboxMebibytes;
  PruneDays days = PruneDays::read(directory);
  const bool isBelieved = wanted.isNow || days.believe(today);
  if (isWanted && isBelieved) {
    if (wanted.outboxDays) {
      logs.removeBefore({now.seconds - *wanted.outboxDays * kSecondsPerDay, now.nanoseconds});
    }
    if (wanted.outboxMebibytes) {
      constexpr std::uint64_t kMax = std::numeric_limits<std::uint64_t>::max() / kBytesPerMebibyte;
      logs.removeUntilBelow(std::min(*wanted.outboxMebibytes, kMax) * kBytesPerMebibyte);
    }
    if (wanted.counterDays) {
      counters =
          removeCounters(*device, today - std::max<std::int64_t>(*wanted.counterDays, kDaysKept),
                         wanted.isDry, problems);
    }
    if (const auto count = neverUploaded(directory, logs.removed()); count.value_or(0) != 0) {
      complain(std::to_string(*count) + " of the removed daily logs " +
               (*count == 1 ? "was" : "were") + " never uploaded");
    }
    logs.tidy();
    days = {today, std::nullopt};
  } else if (isWanted) {
    complain("the clock is " + std::to_string(today - *days.removed) +
             " days ahead of the last prune, so nothing is removed; a later day than today is "
             "believed, and today with --now");
    days.doubted = today;
  }
  std::string error;
  if (isWanted && !wanted.isDry && !days.write(directory, error)) {
    problems.push_back(error);
  }
  PropertyDict lines;
  for (const auto& [file, removed] : logs.removedLines()) {
    lines.set(file, removed);
  }
  problems.insert(problems.begin(), logs.problems().begin(), logs.problems().end());
  Progress::hide();
  printResult({{"days", counters.days},
               {"scalars", counters.scalars},
               {"distributions", counters.distributions},
               {"logs", logs.removed()},
               {"lines", lines}},
              [&] { printRemoved(counters, logs.removed(), lines); });
  for (std::size_t i = 0; i + 1 < problems.size(); ++i) {
    complain(problems[i]);
  }
  if (!problems.empty()) {
    throw CommandFailure(problems.back());
  }
}

}  // namespace

void addPruneCommand(CLI::App& command) {
  const auto wanted = std::make_shared<Pruning>();
  command
      .add_option("--counters", wanted->counterDays,
                  "Keeps the counters of the last N days, and those of three days in any case")
      ->type_name("N")
      ->transform(decimal<std::uint32_t>());
  command
      .add_option("--outbox", wanted->outboxDays,
                  "Keeps the logs and lines that were written in the last N days")
      ->type_name("N")
      ->transform(decimal<std::uint32_t>());
  command
      .add_option("--outbox-size", wanted->outboxMebibytes,
                  "Removes the oldest logs until the outbox is smaller than that, in MiB")
      ->type_name("MIB")
      ->transform(decimal<std::uint64_t>());
  command.add_flag("--now", wanted->isNow, "Believes a clock that has jumped ahead");
  command.add_flag("--dry-run", wanted->isDry, "Prints what would go, and removes nothing");
  command.callback([wanted] { prune(*wanted); });
}

}  // namespace vesprun
