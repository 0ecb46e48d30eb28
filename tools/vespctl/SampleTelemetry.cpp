#include "SampleTelemetry.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <fstream>
#include <optional>
#include <span>
#include <sstream>
#include <string_view>

#include "common/Date.h"

namespace vesprun {
namespace {

using Json = nlohmann::ordered_json;

Json dateEntry(std::int64_t seconds) { return {{"date", dateText({seconds, 0})}}; }

std::int64_t now() {
  return std::chrono::duration_cast<std::chrono::seconds>(
             std::chrono::system_clock::now().time_since_epoch())
      .count();
}

/// When the machine started, in seconds since 1970.
std::optional<std::int64_t> startOfMachine() {
  std::ifstream statistics("/proc/stat");
  for (std::string line; std::getline(statistics, line);) {
    std::istringstream words(line);
    std::string name;
    std::int64_t seconds = 0;
    if (words >> name >> seconds && name == "btime") {
      return seconds;
    }
  }
  return std::nullopt;
}

Json usageRecord(const char* nameKey, std::string_view name, std::int64_t since,
                 const std::int64_t (&counters)[4]) {
  return {{nameKey, name},
          {"since", dateEntry(since)},
          {"wifiInBytes", counters[0]},
          {"wifiOutBytes", counters[1]},
          {"wwanInBytes", counters[2]},
          {"wwanOutBytes", counters[3]}};
}

/// "eth0: BYTES PACKETS and six more received, then the same sent".
std::optional<Json> interfaceRecord(const std::string& line, std::int64_t since) {
  const auto colon = line.find(':');
  if (colon == std::string::npos) {
    return std::nullopt;  // the headings
  }
  std::istringstream words(line.substr(0, colon) + ' ' + line.substr(colon + 1));
  std::string name;
  std::int64_t figures[9] = {};
  words >> name;
  for (std::int64_t& figure : figures) {
    words >> figure;
  }
  if (!words) {
    return std::nullopt;
  }
  const auto [in, out] = std::pair(figures[0], figures[8]);
  if (name.starts_with("ww")) {  // wireless wide-area interfaces are named so
    return usageRecord("procName", name, since, {0, 0, in, out});
  }
  return usageRecord("procName", name, since, {in, out, 0, 0});
}

std::string eccEvent(std::uint8_t identifier, std::span<const std::uint64_t> registers) {
  std::string bytes(72, '\0');
  bytes[0] = static_cast<char>(identifier);
  bytes[1] = static_cast<char>(registers.size());
  for (std::size_t i = 0; i < registers.size() * 8; ++i) {
    bytes[8 + i] = static_cast<char>(registers[i / 8] >> i % 8 * 8 & 0xFF);
  }
  return bytes;
}

}  // namespace

Json sampleChannels() {
  return Json::array({{{"name", "TempMax"}, {"value", 41}},
                      {{"name", "TempMin"}, {"value", 19}},
                      {{"name", "FanStarts"}, {"value", 3}},
                      {{"name", "WakeHistogram"}, {"value", 0}, {"format", 3}},
                      {{"name", "DisplayFrames"}, {"value", 88120}, {"categories", 1}}});
}

Json sampleNVRAMEntry() {
  return {{"class", "DevRegDTNVRAMDiags"},
          {"properties", {{"CommonUsed", 2411}, {"SystemUsed", 871}}},
          {"children", Json::array({{{"class", "DevRegNVRAMBank"},
                                     {"properties", {{"Generation", 1234}, {"Version", 2}}}}})}};
}

Json sampleUsage() {
  constexpr std::int64_t kHour = 3600;
  Json records = Json::array({usageRecord("bundleName", "org.example.reader", now() - kHour,
                                          {48'210'944, 1'204'224, 3'145'728, 90'112}),
                              usageRecord("bundleName", "org.example.messages", now() - kHour,
                                          {912'384, 655'360, 204'800, 1'023})});
  if (const std::optional<std::int64_t> start = startOfMachine()) {
    std::ifstream interfaces("/proc/net/dev");
    for (std::string line; std::getline(interfaces, line);) {
      if (std::optional<Json> record = interfaceRecord(line, *start)) {
        records.push_back(*std::move(record));
      }
    }
  }
  return {{"records", std::move(records)}};
}

std::vector<SampleFile> sampleECCEvents() {
  constexpr std::uint64_t kCorrected[] = {0x8000'0000'0000'0011, 0x2'4F3A'9C40, 1};
  constexpr std::uint64_t kAddressOnly[] = {0x2'4F3A'9C80};
  return {{"kernel/ecc/0001.bin", eccEvent(3, kCorrected)},
          {"kernel/ecc/0002.bin", eccEvent(7, kAddressOnly)}};
}

}  // namespace vesprun
