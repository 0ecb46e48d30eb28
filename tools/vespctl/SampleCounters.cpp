#include "SampleCounters.h"

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

/// /proc/net/dev: "  eth0: bytes packets ..." with eight figures received, then those sent.
void readNetwork(std::vector<ScalarReading>& readings) {
  std::ifstream stream("/proc/net/dev");
  for (std::string line; std::getline(stream, line);) {
    const auto colon = line.find(':');
    if (colon == std::string::npos) {
      continue;
    }
    const std::string name =
        line.substr(line.find_first_not_of(' '), colon - line.find_first_not_of(' '));
    std::istringstream fields(line.substr(colon + 1));
    std::int64_t figures[9] = {};
    for (std::int64_t& figure : figures) {
      fields >> figure;
    }
    readings.push_back({"host.network." + name + ".bytesReceived", figures[0]});
    readings.push_back({"host.network." + name + ".bytesSent", figures[8]});
  }
}

/// A line of /proc/stat such as "ctxt 123456"; 0 when there is none.
std::int64_t readSchedulerFigure(const std::string& wanted) {
  std::ifstream stream("/proc/stat");
  std::string name;
  std::int64_t value = 0;
  for (std::string line; std::getline(stream, line);) {
    if (std::istringstream(line) >> name >> value && name == wanted) {
      return value;
    }
  }
  return 0;
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

}  // namespace

std::vector<ScalarReading> readKernelCounters() {
  std::vector<ScalarReading> readings;
  readMemory(readings);
  readDisks(readings);
  readNetwork(readings);
  readings.push_back({"host.scheduler.contextSwitches", readSchedulerFigure("ctxt")});
  readings.push_back({"host.scheduler.forks", readSchedulerFigure("processes")});
  return readings;
}

std::vector<DistributionReadings> takeReadingBurst() {
  using SteadyClock = std::chrono::steady_clock;
  constexpr auto kPause = std::chrono::milliseconds(1);
  constexpr int kReadings = 200;
  DistributionReadings wakeUps{"host.latency.wakeUpMicroseconds", {}};
  DistributionReadings memory{"host.memory.availableKB", {}};
  DistributionReadings switches{"host.scheduler.contextSwitchesPerReading", {}};
  std::int64_t lastSwitches = readSchedulerFigure("ctxt");
  for (int i = 0; i < kReadings; ++i) {
    const auto start = SteadyClock::now();
    std::this_thread::sleep_for(kPause);
    const std::chrono::duration<double, std::micro> late = SteadyClock::now() - start - kPause;
    wakeUps.values.push_back(late.count());
    memory.values.push_back(static_cast<double>(availableMemory()));
    const std::int64_t nowSwitches = readSchedulerFigure("ctxt");
    switches.values.push_back(static_cast<double>(nowSwitches - lastSwitches));
    lastSwitches = nowSwitches;
  }
  return {wakeUps, memory, switches};
}

}  // namespace vesprun
