#include "days/DaysCommand.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <map>
#include <string>
#include <vector>

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "commandline/Arguments.h"
#include "common/Calendar.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/counters/HostTallybook.h"

namespace vesprun {
namespace {

struct Day {
  std::int64_t scalars = 0;
  std::int64_t distributions = 0;
  std::vector<std::string> logs;
};

std::string joined(const std::vector<std::string>& names) {
  std::string text;
  for (const std::string& name : names) {
    text.append(text.empty() ? "" : ", ").append(name);
  }
  return text;
}

void showDays(std::uint32_t last) {
  Complaints complaints;
  const auto device = openDeviceReadOnly(complaints);
  const std::int32_t today = device->tallybook().TBDaysSince1970();
  const auto first = static_cast<std::int32_t>(std::max<std::int64_t>(
      std::numeric_limits<std::int32_t>::min(), std::int64_t{today} - last + 1));
  std::map<std::int32_t, Day> days;
  const auto addLog = [&](SubmittedLog&& log) {
    if (log.day >= first && log.day <= today) {
      days[log.day].logs.emplace_back(std::move(log.name));
    }
  };
  nameUnreadable(forEachSubmittedLog(device->directory(), addLog));
  const auto countKeys = [&](CounterStore& store) {
    store.readScalars(
        "", first, today,
        [&](std::string_view, std::int32_t day, std::int64_t, bool&) { ++days[day].scalars; });
    store.readDistributions(
        "", first, today,
        [&](std::string_view, std::int32_t day, auto&, bool&) { ++days[day].distributions; });
  };
  if (last != 0) {
    orFail([&](std::string& error) { return device->counters().read(countKeys, error); });
  }
  Table table({{"Date"},
               {"Day", Table::Align::Right},
               {"Scalars", Table::Align::Right},
               {"Distributions", Table::Align::Right},
               {"Daily logs"}});
  for (std::int64_t day = first; day <= today; ++day) {
    Day& shown = days[static_cast<std::int32_t>(day)];
    const std::string date = dateOfDay(static_cast<std::int32_t>(day));
    if (invocation().json) {
      printJson({{"day", day},
                 {"date", date},
                 {"scalars", shown.scalars},
                 {"distributions", shown.distributions},
                 {"logs", shown.logs}});
    } else {
      table.addRow({date, std::to_string(day), std::to_string(shown.scalars),
                    std::to_string(shown.distributions), joined(shown.logs)});
    }
  }
  if (!invocation().json) {
    table.print();
  }
  const std::int64_t stored =
      device->preferences().LGSPreferencesGetIntegerValue(kStoredDayKey, kOwnDomain);
  if (stored >= today) {
    complain("the day of the last run, " + std::to_string(stored) +
             ", is ahead of the clock: until it has passed no run reports a day by itself, but "
             "catch-up does");
  }
}

}  // namespace

void addDaysCommand(CLI::App& command) {
  const auto last = std::make_shared<std::uint32_t>(14);
  command.add_option("--last", *last, "How many days, today the last of them")
      ->type_name("N")
      ->transform(decimal<std::uint32_t>());
  command.callback([last] { showDays(*last); });
}

}  // namespace vesprun
