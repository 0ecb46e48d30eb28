#include "sample/SampleCounters.h"

#include <chrono>
#include <fstream>
#include <sstream>
#include <thread>

#include "platform/host/figures/FigureReader.h"

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

// A line such as "btime 1709630102".
std::optional<std::int64_t> startOfSystem() {
  std::optional<std::int64_t> start;
  forEachLine("/proc/stat", [&](std::istream& words) {
    std::string name;
    std::int64_t value = 0;
    if (words >> name >> value && name == "btime") {
      start = value;
    }
  });
  return start;
}

std::map<std::string, std::int64_t> readKernelCounters() {
  return mergedFigures(
      [](const LinuxFigure& figure) { return figure.kind == FigureKind::Counter; });
}

std::map<std::string, std::vector<double>> takeReadingBurst() {
  using SteadyClock = std::chrono::steady_clock;
  constexpr auto kPause = std::chrono::milliseconds(1);
  constexpr int kReadings = 24;  // as many as a day has that is collected hourly
  std::map<std::string, std::vector<double>> readings;
  for (int i = 0; i < kReadings; ++i) {
    const auto start = SteadyClock::now();
    std::this_thread::sleep_for(kPause);
    const std::chrono::duration<double, std::micro> late = SteadyClock::now() - start - kPause;
    readings["linux.latency.wakeUpMicroseconds"].push_back(late.count());
    for (const auto& [key, value] :
         mergedFigures([](const LinuxFigure& figure) { return figure.file == "/proc/meminfo"; })) {
      readings[key].push_back(static_cast<double>(value));
    }
  }
  return readings;
}

}  // namespace vesprun
