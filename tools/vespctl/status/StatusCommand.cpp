#include "status/StatusCommand.h"

#include <iostream>
#include <limits>
#include <string>

#include "access/CommandDevice.h"
#include "access/ReadOnlyDevice.h"
#include "commandline/Arguments.h"
#include "outbox/FirstReport.h"
#include "status/Findings.h"

namespace vesprun {
namespace {

Json jsonOf(const DeviceStatus& status) {
  Json findings = Json::array();
  for (const auto& [finding, detail] : status.findings) {
    findings.push_back({{"finding", finding}, {"detail", detail}});
  }
  return {{"device", status.device},
          {"today", status.today},
          {"lastReport", status.lastReport ? Json{{"day", status.lastReport->day},
                                                  {"log", status.lastReport->log}}
                                           : Json()},
          {"nextReport", status.nextReport},
          {"keysToday", status.keysToday},
          {"outboxBytes", status.outboxBytes},
          {"whitelist", jsonOrNull(status.whitelist)},
          {"findings", std::move(findings)}};
}

void print(const DeviceStatus& status, HostPlatform& device) {
  Table table({{""}, {""}});
  const auto& last = status.lastReport;
  table.addRow({"Device", status.device});
  table.addRow({"Today", dateOfDay(status.today)});
  table.addRow(
      {"Last report", last ? "of " + dateOfDay(last->day) + ", " + last->log : "none yet"});
  table.addRow(
      {"Next report", "of " + (status.nextReport <= std::numeric_limits<std::int32_t>::max()
                                   ? dateOfDay(static_cast<std::int32_t>(status.nextReport))
                                   : "day " + std::to_string(status.nextReport))});
  table.addRow({"Counted today", std::to_string(status.keysToday) + " keys"});
  table.addRow({"Outbox", sizeText(status.outboxBytes)});
  table.addRow({"Whitelist", status.whitelist.value_or("none")});
  table.print();
  std::cout << '\n';
  if (!last) {
    printText(whenFirstReport(device));
  }
  if (status.findings.empty()) {
    printText("All is well.");
  }
  for (const auto& [finding, detail] : status.findings) {
    printText(std::string(finding) + ": " + detail, 4);
  }
}

void showStatus() {
  const ReadOnlyDevice opened;
  const DeviceStatus status = readStatus(*opened.device);
  printResult(jsonOf(status), [&] { print(status, *opened.device); });
  invocation().status = status.findings.empty() ? 0 : 1;
}

}  // namespace

void addStatusCommand(CLI::App& command) { command.callback(showStatus); }

}  // namespace vesprun
