#include "days/CatchUpCommand.h"

#include <cstdint>
#include <optional>
#include <string>

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "commandline/Arguments.h"
#include "days/MissingReports.h"
#include "outbox/SubmittedLogs.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

void catchUp(std::uint32_t last, bool isDry) {
  Complaints seen;
  const auto device = isDry ? openDeviceReadOnly(seen) : openDevice();
  const InstalledPlatform installed(*device);
  const auto lock = isDry ? std::nullopt : std::optional(takeDailyWork(device->directory()));
  const MissingReports reports = submitMissingReports(*device, last, isDry);
  nameUnreadable(reports.unreadable);
  seen.print();
  printResult(Json(reports.submitted), [&] {
    if (reports.submitted.empty() && reports.failed.empty()) {
      printText("No report is missing.");
    }
    for (const std::int32_t day : reports.submitted) {
      printText((isDry ? "Would submit the report of " : "Submitted the report of ") +
                dateOfDay(day) + '.');
    }
  });
  std::string failed;
  for (const std::int32_t day : reports.failed) {
    failed += (failed.empty() ? "" : ", ") + std::to_string(day);
  }
  if (!failed.empty()) {
    throw CommandFailure("not submitted: " + failed +
                         (isDry ? "" : "; \"vespctl show log --last 20\" says why"));
  }
}

}  // namespace

void addCatchUpCommand(CLI::App& command) {
  struct Arguments {
    std::uint32_t last = 7;
    bool isDry = false;
  };
  const auto arguments = std::make_shared<Arguments>();
  command.add_option("--last", arguments->last, "How many days, the day before yesterday the last")
      ->type_name("N")
      ->transform(decimal<std::uint32_t>());
  command.add_flag("--dry-run", arguments->isDry,
                   "Tells what it would submit, and submits nothing");
  command.callback([arguments] { catchUp(arguments->last, arguments->isDry); });
}

}  // namespace vesprun
