#include "export/ExportCommand.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <iostream>
#include <iterator>

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "commandline/Arguments.h"
#include "commandline/Completion.h"
#include "export/LogExport.h"
#include "export/Metrics.h"
#include "outbox/SubmittedLogs.h"

namespace vesprun {
namespace {

constexpr const char* kFormats[] = {"lines", "csv", "openmetrics"};

struct Export {
  std::string format = "lines";
  std::string device;
  GivenDays days;
};

std::string figureRows(const LogExport& source, const SubmittedLog& log) {
  FigureRows rows(source.sourceOf(log));
  for (const auto& [key, value] : *log.document.findDict("TBScalars")) {
    rows.addScalar(key, value.number()->asInt64());
  }
  for (const auto& [key, value] : *log.document.findDict("TBDistributions")) {
    const PropertyArray& numbers = *value.array();
    std::array<double, 4> statistics{};
    std::transform(numbers.begin(), numbers.begin() + 4, statistics.begin(),
                   [](const PropertyValue& number) { return number.number()->asDouble(); });
    rows.addDistribution(key, statistics, numbers[4].number()->asInt64());
  }
  for (const auto& [key, value] : *log.document.findDict("TBDistributionsHistogram")) {
    for (const auto& [label, count] : *value.dict()) {
      rows.addBucket(key, label, count.number()->asUInt64());
    }
  }
  return rows.text();
}

void exportLogs(const Export& wanted) {
  Complaints complaints;
  const auto platform = openDeviceReadOnly(complaints);
  const std::int32_t today = platform->tallybook().TBDaysSince1970();
  const LogExport source(*platform, wanted.device);
  const bool isCsv = wanted.format == "csv";
  if (isCsv) {
    std::cout << FigureRows::kColumns;
  }
  std::optional<SubmittedLog> newest;
  std::vector<UnreadableLog> refused;
  const auto print = [&](SubmittedLog&& log) {
    if (log.day < wanted.days.first(today) || log.day > wanted.days.last(today)) {
      return;
    }
    std::string why;
    const std::optional<std::string> line = source.lineOf(log, why);
    if (!line) {
      refused.push_back({log.name, why, true});
    } else if (wanted.format == "lines") {
      std::cout << *line << '\n';
    } else if (isCsv) {
      std::cout << figureRows(source, log);
    } else {
      newest = std::move(log);
    }
  };
  std::vector<UnreadableLog> unreadable = forEachSubmittedLog(platform->directory(), print);
  if (newest) {
    std::cout << metricsText(newest->day, newest->document);
  }
  unreadable.insert(unreadable.end(), refused.begin(), refused.end());
  failIfUnreadable(unreadable);
}

}  // namespace

void addExportCommand(CLI::App& command) {
  const auto wanted = std::make_shared<Export>();
  const std::vector<std::string> formats(std::begin(kFormats), std::end(kFormats));
  completeWith(command
                   .add_option("--format", wanted->format,
                               "lines for vespfleet, csv with a row for each figure, or "
                               "openmetrics of the newest log")
                   ->type_name("FORMAT")
                   ->check(CLI::IsMember(formats)),
               [formats] { return formats; });
  addDeviceName(command, wanted->device);
  addDays(command, wanted->days);
  command.callback([wanted] { exportLogs(*wanted); });
}

}  // namespace vesprun
