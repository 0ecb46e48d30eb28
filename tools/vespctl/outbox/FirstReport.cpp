#include "outbox/FirstReport.h"

#include <algorithm>
#include <optional>

#include "commandline/Arguments.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/counters/HostTallybook.h"

namespace vesprun {

std::string whenFirstReport(HostPlatform& device) {
  if (std::ranges::any_of(namesOfLogs(device.directory()), isDailyLogName)) {
    return "";
  }
  if (!device.logsmith().DiagnosticLogSubmissionEnabled()) {
    return "No report yet: submission is switched off on this device.";
  }
  const std::int32_t today = device.tallybook().TBDaysSince1970();
  const std::int64_t stored =
      device.preferences().LGSPreferencesGetIntegerValue(kStoredDayKey, kOwnDomain);
  // A report reads its day and the one before.
  const std::int64_t next =
      std::max(std::int64_t{today} - 1, std::min<std::int64_t>(stored, today) + 1);
  std::optional<std::int32_t> counted;
  std::string ignored;
  device.counters().read([&](CounterStore& store) { counted = store.nextDay(next - 2); }, ignored);
  if (!counted) {
    return "There is no report yet, since nothing was counted on the last two days: a report of "
           "today comes tomorrow if something is counted today, say by \"vespctl collect\".";
  }
  const auto day = static_cast<std::int32_t>(std::max<std::int64_t>(*counted, next));
  return "There is no report yet: the first one is of " + dateOfDay(day) + " and comes with the " +
         (day < today ? "next daily run." : "first daily run from " + dateOfDay(day + 1) + " on.");
}

}  // namespace vesprun
