#include "device/CounterRows.h"

#include <cstdint>
#include <limits>
#include <optional>
#include <set>
#include <string_view>

#include "Command.h"
#include "Complaints.h"
#include "commandline/Arguments.h"
#include "commandline/Completion.h"
#include "common/TextForm.h"
#include "platform/host/counters/HostTallybook.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

using DayLimits = std::numeric_limits<std::int32_t>;

struct WantedRows {
  std::string key;
  bool isExact = false;
  std::optional<GivenDay> from;
  std::optional<GivenDay> to;
};

/// Takes a row as JSON, with its figures as text for people.
using TakeRow = std::function<void(Json&& row, const std::string& figures)>;

std::string figuresText(const PropertyArray& statistics) {
  return "minimum " + textForm(statistics[0]) + ", maximum " + textForm(statistics[1]) + ", mean " +
         textForm(statistics[2]) + ", deviations " + textForm(statistics[3]) + ", count " +
         textForm(statistics[4]);
}

/// The rows of one day, scalars before distributions, each by key.
void takeDay(CounterStore& store, std::int32_t day, const std::string& prefix, bool isWhole,
             const TakeRow& take) {
  store.readScalars(prefix, day, day,
                    [&](std::string_view key, std::int32_t, std::int64_t value, bool&) {
                      if (!isWhole || key == prefix) {
                        take({{"day", day}, {"kind", "scalar"}, {"key", key}, {"value", value}},
                             std::to_string(value));
                      }
                    });
  store.readDistributions(
      prefix, day, day,
      [&](std::string_view key, std::int32_t, TBHistoryDistributionEnumerator& values, bool&) {
        if (isWhole && key != prefix) {
          return;
        }
        TBReport report(nullptr);
        report.computeAndAddDistributionForKeyWithOptions(values, key, DistributionOptions());
        const PropertyValue& statistics = *report.distributionsOutput().find(key);
        take({{"day", day}, {"kind", "distribution"}, {"key", key}, {"statistics", statistics}},
             figuresText(*statistics.array()));
      });
}

void printRows(const WantedRows& wanted) {
  Complaints complaints;
  const auto device = openDeviceReadOnly(complaints);
  const bool isPrefix = !wanted.isExact && wanted.key.ends_with('*');
  const std::string prefix = wanted.key.substr(0, wanted.key.size() - (isPrefix ? 1 : 0));
  const std::int32_t today = device->tallybook().TBDaysSince1970();
  const std::int32_t from = wanted.from ? wanted.from->on(today) : DayLimits::min();
  const std::int32_t to = wanted.to ? wanted.to->on(today) : DayLimits::max();
  Table table({{"Date"}, {"Day", Table::Align::Right}, {"Kind"}, {"Key"}, {"Value"}});
  const TakeRow take = [&table](Json&& row, const std::string& figures) {
    if (invocation().json) {
      printJson(row);
      return;
    }
    const auto day = row["day"].get<std::int32_t>();
    table.addRow({dateOfDay(day), std::to_string(day), row["kind"].get<std::string>(),
                  row["key"].get<std::string>(), figures});
  };
  const auto read = [&](CounterStore& store) {
    std::optional<std::int32_t> day = store.nextDay(std::int64_t{from} - 1);
    for (; day && *day <= to; day = store.nextDay(*day)) {
      takeDay(store, *day, prefix, !isPrefix, take);
    }
  };
  orFail([&](std::string& error) { return device->counters().read(read, error); });
  if (!table.empty()) {
    table.print();
  } else if (!invocation().json) {
    printText("Nothing was counted there in these days.");
  }
}

}  // namespace

void addGetCounters(CLI::App& command) {
  const auto wanted = std::make_shared<WantedRows>();
  completeWith(
      command
          .add_option("KEY", wanted->key, "The key, or with a * at its end the beginning of keys")
          ->required(),
      counterKeys);
  command.add_flag("--exact", wanted->isExact, "A * at the end belongs to the key");
  addDay(command, "--from", wanted->from, "The first day");
  addDay(command, "--to", wanted->to, "The last day");
  command.callback([wanted] { printRows(*wanted); });
}

std::vector<std::string> counterKeys() {
  Complaints complaints;
  const auto device = openDeviceReadOnly(complaints);
  std::set<std::string, std::less<>> keys;
  const auto read = [&keys](CounterStore& store) {
    store.readScalars(
        "", DayLimits::min(), DayLimits::max(),
        [&keys](std::string_view key, std::int32_t, std::int64_t, bool&) { keys.emplace(key); });
    store.readDistributions(
        "", DayLimits::min(), DayLimits::max(),
        [&keys](std::string_view key, std::int32_t, TBHistoryDistributionEnumerator&, bool&) {
          keys.emplace(key);
        });
  };
  std::string error;
  device->counters().read(read, error);
  return {keys.begin(), keys.end()};
}

}  // namespace vesprun
