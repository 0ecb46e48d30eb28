#include "sample/SampleCounters.h"

#include <chrono>
#include <fstream>
#include <sstream>
#include <thread>

namespace vesprun {
namespace {

/// /proc/meminfo: "MemTotal:       16384256 kB".
void readMemory(std::vector<ScalarReading>& readings) {
  std::ifstream stream("/proc/meminfo");
  std::string name;
  std::int64_t value = 0;
  for (std::string line; std::getline(stream, line);) {
    if (std::istringstream(line) >> name >> value && name.back() == ':') {
      name.pop_back();
      readings.push_back({"host.memory." + name, value});
    }
  }
}

/// /proc/diskstats: major, minor and name, then reads, merged reads, sectors read, ms reading,
/// writes, merged writes, sectors written, ms writing.
void readDisks(std::vector<ScalarReading>& readings) {
  std::ifstream stream("/proc/diskstats");
  for (std::string line; std::getline(stream, line);) {
    std::istringstream fields(line);
    int major = 0;
    int minor = 0;
    std::string name;
    std::int64_t reads = 0;
    std::int64_t readsMerged = 0;
    std::int64_t sectorsRead = 0;
    std::int64_t millisecondsReading = 0;
    std::int64_t writes = 0;
    std::int64_t writesMerged = 0;
    std::int64_t sectorsWritten = 0;
    if (fields >> major >> minor >> name >> reads >> readsMerged >> sectorsRead >>
            millisecondsReading >> writes >> writesMerged >> sectorsWritten &&
        reads + writes > 0) {
      readings.push_back({"host.disk." + name + ".reads", reads});
      readings.push_back({"host.disk." + name + ".sectorsRead", sectorsRead});
      readings.push_back({"host.disk." + name + ".writes", writes});
      readings.push_back({"host.disk." + name + ".sectorsWritten", sectorsWritten});
    }
  }
}

std::int64_t availableMemory() {
  std::vector<ScalarReading> readings;
  readMemory(readings);
  for (const auto& [key, value] : readings) {
    if (key == "host.memory.MemAvailable") {
      return value;
    }
  }
  return 0;
}

std::int64_t contextSwitches() { return readSchedulerFigure("ctxt").value_or(0); }

}  // namespace

// /proc/net/dev: "  eth0: bytes packets ..." with eight figures received, then those sent.
std::vector<InterfaceReading> readInterfaces() {
  std::vector<InterfaceReading> interfaces;
  std::ifstream stream("/proc/net/dev");
  for (std::string line; std::getline(stream, line);) {
    const auto colon = line.find(':');
    if (colon == std::string::npos) {
      continue;  // the headings
    }
    std::istringstream words(line.substr(0, colon) + ' ' + line.substr(colon + 1));
    std::string name;
    std::int64_t figures[9] = {};
    words >> name;
    for (std::int64_t& figure : figures) {
      words >> figure;
    }
    if (words) {
      interfaces.push_back({name, figures[0], figures[8]});
    }
  }
  return interfaces;
}

// A line of /proc/stat such as "ctxt 123456".
std::optional<std::int64_t> readSchedulerFigure(std::string_view name) {
  std::ifstream stream("/proc/stat");
  std::string found;
  std::int64_t value = 0;
  for (std::string line; std::getline(stream, line);) {
    if (std::istringstream(line) >> found >> value && found == name) {
      return value;
    }
  }
  return std::nullopt;
}

std::vector<ScalarReading> readKernelCounters() {
  std::vector<ScalarReading> readings;
  readMemory(readings);
  readDisks(readings);
  for (const InterfaceReading& interface : readInterfaces()) {
    const std::string key = "host.network." + interface.name;
    readings.push_back({key + ".bytesReceived", interface.bytesReceived});
    readings.push_back({key + ".bytesSent", interface.bytesSent});
  }
  readings.push_back({"host.scheduler.contextSwitches", contextSwitches()});
  readings.push_back({"host.scheduler.forks", readSchedulerFigure("processes").value_or(0)});
  return readings;
}

std::vector<DistributionReadings> takeReadingBurst() {
  using SteadyClock = std::chrono::steady_clock;
  constexpr auto kPause = std::chrono::milliseconds(1);
  constexpr int kReadings = 200;
  DistributionReadings wakeUps{"host.latency.wakeUpMicroseconds", {}};
  DistributionReadings memory{"host.memory.availableKB", {}};
  DistributionReadings switches{"host.scheduler.contextSwitchesPerReading", {}};
  std::int64_t lastSwitches = contextSwitches();
  for (int i = 0; i < kReadings; ++i) {
    const auto start = SteadyClock::now();
    std::this_thread::sleep_for(kPause);
    const std::chrono::duration<double, std::micro> late = SteadyClock::now() - start - kPause;
    wakeUps.values.push_back(late.count());
    memory.values.push_back(static_cast<double>(availableMemory()));
    const std::int64_t nowSwitches = contextSwitches();
    switches.values.push_back(static_cast<double>(nowSwitches - lastSwitches));
    lastSwitches = nowSwitches;
  }
  return {wakeUps, memory, switches};
}

}  // namespace vesprun
