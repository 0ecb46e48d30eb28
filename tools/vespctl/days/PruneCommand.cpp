#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Command.h"
#include "Complaints.h"
#include "DecimalNumber.h"
#include "common/Calendar.h"
#include "days/LogPruning.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/JsonLines.h"

namespace vesprun {
namespace {

struct Pruning {
  std::string directory;
  std::optional<std::uint32_t> counterDays;
  std::optional<std::uint32_t> outboxDays;
  std::optional<std::uint64_t> outboxMebibytes;
};

/// Removes the lines of a file in the outbox that were written before `time`, and returns their
/// number. A line without a time stays.
std::uint64_t removeLines(const HostPath& path, const Date& time,
                          std::vector<std::string>& problems) {
  static constexpr std::string_view kBegin = "{\"time\":\"";
  std::string error;
  const auto isOlder = [&time](std::string_view text) {
    if (text.starts_with(kBegin)) {  // as our lines do; most are not old and need no parsing
      const std::string_view rest = text.substr(kBegin.size());
      const std::optional<Date> date = parseDateText(rest.substr(0, rest.find('"')));
      if (date && *date >= time) {
        return false;
      }
    }
    std::string malformed;
    const std::optional<PropertyValue> line = valueFromJsonText(text, malformed);
    const PropertyDict* fields = line ? line->dict() : nullptr;
    const std::string* written = fields != nullptr ? fields->findString("time") : nullptr;
    const std::optional<Date> date = written != nullptr ? parseDateText(*written) : std::nullopt;
    return date && *date < time;
  };
  const std::optional<std::uint64_t> removed = JsonLines(path).remove(isOlder, error);
  if (!removed) {
    problems.push_back(error);
  }
  return removed.value_or(0);
}

/// Removes the counters of days before `day`. What cannot be done goes into `problems`.
CounterStore::Removed removeCounters(HostPlatform& device, std::int64_t day,
                                     std::vector<std::string>& problems) {
  constexpr std::int64_t kBeforeAllDays = std::numeric_limits<std::int64_t>::min();
  Complaints complaints(&device.systemLog());
  HostTallybook counters(device.directory(), device.clock(), device.preferences(), complaints);
  CounterStore::Removed removed;
  std::optional<std::int32_t> first;
  std::string error;
  const auto remove = [&](CounterStore& store) {
    removed = store.removeBefore(day);
    store.giveRoomBack();
    return true;
  };
  // A write without anything to remove would still lock the database, or even make it.
  if (!counters.read([&](CounterStore& store) { first = store.nextDay(kBeforeAllDays); }, error) ||
      (first && *first < day && !counters.write(remove, error))) {
    problems.push_back(error);
  }
  complaints.print();
  return removed;
}

void prune(const Pruning& wanted) {
  // Today's and tomorrow's reports read these days.
  constexpr std::int64_t kDaysKept = 2;
  constexpr std::uint64_t kBytesPerMebibyte = 1048576;
  const auto device = openDevice(wanted.directory);
  const FileDescriptor lock = takeDailyWork(device->directory());
  const Date now = device->clock().now();
  std::vector<std::string> problems;
  LogPruning logs(device->directory(), now);
  PropertyDict lines;
  if (wanted.outboxDays) {
    const Date time{now.seconds - *wanted.outboxDays * kSecondsPerDay, now.nanoseconds};
    logs.removeBefore(time);
    for (const char* const file :
         {"records.jsonl", "events.jsonl", "notifications.jsonl", "log.jsonl"}) {
      const HostPath path = device->directory().hostPath(std::string("outbox/") + file);
      if (const std::uint64_t removed = removeLines(path, time, problems); removed != 0) {
        lines.set(file, removed);
      }
    }
  }
  if (wanted.outboxMebibytes) {
    constexpr std::uint64_t kMost = std::numeric_limits<std::uint64_t>::max() / kBytesPerMebibyte;
    logs.removeUntilBelow(std::min(*wanted.outboxMebibytes, kMost) * kBytesPerMebibyte);
  }
  CounterStore::Removed counters;
  if (wanted.counterDays) {
    const std::int64_t today = daysSince1970(now);
    counters = removeCounters(
        *device, today - std::max<std::int64_t>(*wanted.counterDays, kDaysKept), problems);
  }
  problems.insert(problems.begin(), logs.problems().begin(), logs.problems().end());
  printJson(PropertyDict{{"days", PropertyArray(counters.days.begin(), counters.days.end())},
                         {"scalars", counters.scalars},
                         {"distributions", counters.distributions},
                         {"logs", PropertyArray(logs.removed().begin(), logs.removed().end())},
                         {"lines", std::move(lines)}});
  for (std::size_t i = 0; i + 1 < problems.size(); ++i) {
    std::fprintf(stderr, "vespctl: %s\n", printableText(problems[i]).c_str());
  }
  if (!problems.empty()) {
    throw CommandFailure(problems.back());
  }
}

}  // namespace

void addPruneCommand(CLI::App& vespctl) {
  const auto wanted = std::make_shared<Pruning>();
  CLI::App* command = addDeviceCommand(
      vespctl, "prune", "Removes what is old, and prints what went", wanted->directory);
  command
      ->add_option("--counters", wanted->counterDays,
                   "Keeps the counters of the last N days, and those of three days in any case")
      ->transform(decimal<std::uint32_t>());
  command
      ->add_option("--outbox", wanted->outboxDays,
                   "Keeps the logs and lines that were written in the last N days")
      ->transform(decimal<std::uint32_t>());
  command
      ->add_option("--outbox-size", wanted->outboxMebibytes,
                   "Removes the oldest logs until the outbox is smaller than that, in MiB")
      ->transform(decimal<std::uint64_t>());
  command->callback([wanted] { prune(*wanted); });
}

}  // namespace vesprun
