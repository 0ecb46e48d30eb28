#include "device/CounterRows.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <optional>
#include <string_view>

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "access/ReadOnlyDevice.h"
#include "commandline/Arguments.h"
#include "commandline/Completion.h"
#include "commandline/NearestName.h"
#include "common/TextForm.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/figures/FigureTable.h"
#include "report/TBReport.h"
#include "whitelist/WhitelistDocument.h"

namespace vesprun {
namespace {

using DayLimits = std::numeric_limits<std::int32_t>;

struct WantedRows {
  std::string key;
  bool isExact = false;
  GivenDays days;
};

/// Takes a row as JSON, with its figures as text for people.
using TakeRow = std::function<void(Json&& row, const std::string& figures)>;

std::string figuresText(const PropertyArray& statistics) {
  return "minimum " + textForm(statistics[0]) + ", maximum " + textForm(statistics[1]) + ", mean " +
         textForm(statistics[2]) + ", deviations " + textForm(statistics[3]) + ", count " +
         textForm(statistics[4]);
}

/// The unit that the table of figures has for a key; empty for any other.
std::string_view unitOf(std::string_view key) {
  const auto isOf = [key](const LinuxFigure& figure) {
    return figure.key == key || (figure.key.ends_with('.') && key.starts_with(figure.key));
  };
  const auto figure = std::ranges::find_if(linuxFigures, isOf);
  return figure == linuxFigures.end() || figure->unit == "count" ? "" : figure->unit;
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

/// Why no row was found, and where some are.
std::string whyNoRows(CounterStore& store, const std::string& prefix, bool isWhole) {
  NearestName nearest(prefix, !isWhole);
  std::optional<std::int32_t> first;
  std::int32_t last = 0;
  const auto take = [&](std::string_view key, std::int32_t day) {
    if (isWhole ? key == prefix : key.starts_with(prefix)) {
      first = std::min(first.value_or(day), day);
      last = std::max(last, day);
    } else {
      nearest.take(key);
    }
  };
  store.readScalars({}, DayLimits::min(), DayLimits::max(),
                    [&](std::string_view key, std::int32_t day, auto&&...) { take(key, day); });
  store.readDistributions(
      {}, DayLimits::min(), DayLimits::max(),
      [&](std::string_view key, std::int32_t day, auto&&...) { take(key, day); });
  const std::string what =
      isWhole ? inQuotes(prefix) : "A key that begins with " + inQuotes(prefix);
  if (first) {
    return what + " was not counted in these days, but from " + dateOfDay(*first) + " to " +
           dateOfDay(last) + '.';
  }
  return what + " was never counted" +
         (nearest.found().empty() ? ", nor was any other key."
                                  : "; the nearest that was is " + inQuotes(nearest.found()) + '.');
}

void printRows(const WantedRows& wanted) {
  Complaints complaints;
  const auto device = openDeviceReadOnly(complaints);
  const bool isPrefix = !wanted.isExact && wanted.key.ends_with('*');
  const std::string prefix = wanted.key.substr(0, wanted.key.size() - (isPrefix ? 1 : 0));
  const std::int32_t today = device->tallybook().TBDaysSince1970();
  Table table({{"Date"}, {"Day", Table::Align::Right}, {"Kind"}, {"Key"}, {"Value"}});
  const TakeRow take = [&table](Json&& row, const std::string& figures) {
    if (invocation().json) {
      printJson(row);
      return;
    }
    const auto day = row["day"].get<std::int32_t>();
    const auto key = row["key"].get<std::string>();
    const std::string_view unit = unitOf(key);
    const char* const before = row["kind"] == "scalar" ? " " : ", in ";
    table.addRow({dateOfDay(day), std::to_string(day), row["kind"].get<std::string>(), key,
                  unit.empty() ? figures : (figures + before).append(unit)});
  };
  std::string note;
  const auto read = [&](CounterStore& store) {
    std::optional<std::int32_t> day = store.nextDay(std::int64_t{wanted.days.first(today)} - 1);
    for (; day && *day <= wanted.days.last(today); day = store.nextDay(*day)) {
      takeDay(store, *day, prefix, !isPrefix, take);
    }
    if (table.empty() && !invocation().json) {
      note = whyNoRows(store, prefix, !isPrefix);
    }
  };
  orFail([&](std::string& error) { return device->counters().read(read, error); });
  if (!invocation().json) {
    table.printOr(note.empty() ? "Nothing was ever counted on this device." : note);
  }
}

}  // namespace

void addGetCounters(CLI::App& command) {
  const auto wanted = std::make_shared<WantedRows>();
  completeWith(
      command
          .add_option("KEY", wanted->key, "The key, or with a * at its end the beginning of keys")
          ->required(),
      countedKeys);
  command.add_flag("--exact", wanted->isExact, "A * at the end belongs to the key");
  addDays(command, wanted->days);
  command.callback([wanted] { printRows(*wanted); });
}

}  // namespace vesprun
