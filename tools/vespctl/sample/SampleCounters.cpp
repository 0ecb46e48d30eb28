#include "sample/SampleCounters.h"

#include <algorithm>
#include <chrono>
#include <fstream>
#include <sstream>
#include <thread>

namespace vesprun {
namespace {

/// Calls `take` with the words of every line of a file of the kernel.
template <typename Take>
void forEachLine(const char* file, const Take& take) {
  std::ifstream stream(file);
  for (std::string line; std::getline(stream, line);) {
    std::istringstream words(line);
    take(words);
  }
}

/// "MemTotal:       16384256 kB".
void readMemory(std::vector<ScalarReading>& readings) {
  forEachLine("/proc/meminfo", [&](std::istream& words) {
    std::string name;
    std::int64_t value = 0;
    if (words >> name >> value && name.back() == ':') {
      name.pop_back();
      readings.push_back({"host.memory." + name, value});
    }
  });
}

/// Major, minor and name, then reads, merged reads, sectors read, ms reading, writes, merged
/// writes, sectors written, ms writing.
void readDisks(std::vector<ScalarReading>& readings) {
  forEachLine("/proc/diskstats", [&](std::istream& words) {
    std::string skipped;
    std::string name;
    std::int64_t figures[7] = {};
    words >> skipped >> skipped >> name;
    for (std::int64_t& figure : figures) {
      words >> figure;
    }
    if (words && figures[0] + figures[4] > 0) {
      const std::string key = "host.disk." + name;
      readings.push_back({key + ".reads", figures[0]});
      readings.push_back({key + ".sectorsRead", figures[2]});
      readings.push_back({key + ".writes", figures[4]});
      readings.push_back({key + ".sectorsWritten", figures[6]});
    }
  });
}

std::int64_t availableMemory() {
  std::vector<ScalarReading> readings;
  readMemory(readings);
  const auto found = std::ranges::find(readings, "host.memory.MemAvailable", &ScalarReading::key);
  return found != readings.end() ? found->value : 0;
}

std::int64_t contextSwitches() { return readSchedulerFigure("ctxt").value_or(0); }

}  // namespace

// "  eth0: bytes packets ..." with eight figures received, then those sent.
std::vector<InterfaceReading> readInterfaces() {
  std::vector<InterfaceReading> interfaces;
  forEachLine("/proc/net/dev", [&](std::istream& words) {
    std::string name;
    std::int64_t figures[9] = {};
    words >> std::ws;
    if (!std::getline(words, name, ':') || words.eof()) {
      return;  // the headings
    }
    for (std::int64_t& figure : figures) {
      words >> figure;
    }
    if (words) {
      interfaces.push_back({name, figures[0], figures[8]});
    }
  });
  return interfaces;
}

// A line such as "ctxt 123456".
std::optional<std::int64_t> readSchedulerFigure(std::string_view name) {
  std::optional<std::int64_t> figure;
  forEachLine("/proc/stat", [&](std::istream& words) {
    std::string found;
    std::int64_t value = 0;
    if (words >> found >> value && found == name) {
      figure = value;
    }
  });
  return figure;
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
