#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <limits>
#include <map>
#include <string>

#include "Command.h"
#include "Complaints.h"
#include "DecimalNumber.h"
#include "common/Calendar.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/counters/HostTallybook.h"

namespace vesprun {
namespace {

struct Day {
  std::int64_t scalars = 0;
  std::int64_t distributions = 0;
  PropertyArray logs;
};

std::string dateOf(std::int32_t day) {
  const std::string date = dateText(startOfDay(day));
  return date.substr(0, date.find('T'));
}

void showDays(const std::string& directory, std::uint32_t last) {
  Complaints complaints;
  const auto device = openDeviceReadOnly(directory, complaints);
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
  for (std::int64_t day = first; day <= today; ++day) {
    Day& shown = days[static_cast<std::int32_t>(day)];
    printJson(PropertyDict{{"day", day},
                           {"date", dateOf(static_cast<std::int32_t>(day))},
                           {"scalars", shown.scalars},
                           {"distributions", shown.distributions},
                           {"logs", std::move(shown.logs)}});
  }
  const std::int64_t stored =
      device->preferences().LGSPreferencesGetIntegerValue(kStoredDayKey, kOwnDomain);
  if (stored >= today) {
    std::fprintf(
        stderr,
        "vespctl: the day of the last run, %lld, is ahead of the clock: until it has passed "
        "no run reports a day by itself, but catch-up does\n",
        static_cast<long long>(stored));
  }
}

}  // namespace

void addDaysCommand(CLI::App& vespctl) {
  struct Arguments {
    std::string directory;
    std::uint32_t last = 14;
  };
  const auto arguments = std::make_shared<Arguments>();
  CLI::App* command = addDeviceCommand(
      vespctl, "days", "Prints what is kept of the last days, and the names of their daily logs",
      arguments->directory);
  command->add_option("--last", arguments->last, "How many days, today the last of them")
      ->transform(decimal<std::uint32_t>());
  command->callback([arguments] { showDays(arguments->directory, arguments->last); });
}

}  // namespace vesprun
