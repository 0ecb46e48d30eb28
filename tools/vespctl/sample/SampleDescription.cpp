#include "sample/SampleDescription.h"

#include <string>
#include <string_view>
#include <vector>

#include "access/CommandDevice.h"
#include "buffers/DeviceBuffers.h"
#include "common/LittleEndian.h"
#include "platform/host/files/AtomicFile.h"
#include "sample/SampleCounters.h"
#include "sample/SampleData.h"

namespace vesprun {
namespace {

constexpr std::uint64_t kHoursInUse = 10'000;  // with power
constexpr std::uint64_t kHoursSinceFormat = 12'000;
constexpr std::uint64_t kSecondsPerHour = 3600;

using Values = std::vector<std::uint64_t>;

/// Bins that sum up to `total`, each holding about half of what is left.
Values histogram(std::uint64_t total, std::size_t count) {
  Values bins(count);
  for (std::size_t i = 0; i + 1 < count; ++i) {
    bins[i] = total - total / 2;
    total /= 2;
  }
  bins.back() = total;
  return bins;
}

/// The elements of a statistic after `steps`; none when nothing is said about it.
Values valuesOf(const Json& figures, std::string_view name, std::size_t count,
                std::uint64_t steps) {
  const auto figure = figures.find(name);
  if (figure == figures.end()) {
    return {};
  }
  if (figure->is_array()) {
    return figure->get<Values>();
  }
  const std::uint64_t value = figure->is_object()
                                  ? (figure->value("start", std::uint64_t{0}) +
                                     figure->at("step").get<std::uint64_t>() * steps) /
                                        figure->value("per", std::uint64_t{1})
                                  : figure->get<std::uint64_t>();
  return count == 1 ? Values{value} : histogram(value, count);
}

std::uint32_t busCount() {
  return sampleData().at("/controller/properties/Controller Characteristics/num-bus"_json_pointer);
}

/// Base and FTL statistics (one buffer serves both) `hoursBack` hours before `now`; every counter
/// has risen evenly.
Bytes sampleStatistics(const Date& now, std::uint64_t hoursBack) {
  const auto nowSeconds = static_cast<std::uint64_t>(now.seconds);
  const std::uint64_t takenAt = nowSeconds - hoursBack * kSecondsPerHour;
  Json figures = sampleData().at("statistics");
  figures["utilFormatTime"] = nowSeconds - kHoursSinceFormat * kSecondsPerHour;
  figures["magazineInstanceMeta"] = (takenAt & 0xFFFF'FFFF) << 24;
  return everyStatistic([&](const ORUStatKey& key) {
    return valuesOf(figures, key.name, key.count, kHoursInUse - hoursBack);
  });
}

Bytes sampleMSPStatistics(std::uint64_t index) {
  return everyMSPStatistic([&](const ORUMSPKey& key) {
    return valuesOf(sampleData().at("msp"), key.name, key.count, index);
  });
}

Bytes sampleTelemetry(std::uint32_t kind) {
  return telemetryList(
      busCount(),
      [&](std::uint32_t bus, std::uint32_t word) {
        return (4'000'000U >> (word % 24)) + bus * 10 + kind;
      },
      [&](std::uint32_t bus, std::uint32_t word) {
        const std::uint32_t words[] = {41'000 + bus, 152, 3, 24, 90, kind, 576, 0};
        return words[word];
      });
}

Bytes sampleValidity() {
  constexpr std::uint32_t kLists = 4;
  constexpr std::uint32_t kEntries = 16 * kLists;
  std::vector<std::uint32_t> words{kEntries, 1, 0, 0};
  for (std::uint32_t entry = 0; entry < kEntries; ++entry) {
    const std::uint32_t percent = 100 - entry * 100 / kEntries;
    words.insert(words.end(), {entry, entry % kLists, percent, 0, 0});
  }
  return bytesOf(words);
}

Bytes sampleDefects() {
  constexpr std::uint32_t kDefects = 12;
  std::vector<std::uint32_t> words{1, kDefects, kDefects};
  for (std::uint32_t defect = 0; defect < kDefects; ++defect) {
    const std::uint32_t bus = defect % busCount();
    const std::uint32_t chipEnable = defect % 2;
    const std::uint32_t mode = defect % 3;
    words.insert(words.end(),
                 {chipEnable << 16 | bus, defect % 2, 37 + 113 * defect, 0, 5, 0, 30, mode});
  }
  return bytesOf(words);
}

constexpr std::uint32_t kMSPs = 2;
constexpr std::uint32_t kTelemetryKinds = 3;

/// The snapshots that the magazine holds, in hours back.
constexpr std::uint32_t kMagazineHours[] = {0, 4, 8, 12, 16, 20, 24, 168, 720};

void writeFile(const DeviceDirectory& directory, std::string_view devicePath,
               std::string_view content) {
  orFail([&](std::string& error) {
    return replaceFile(directory.hostPath(devicePath), content, error);
  });
}

void writeFile(const DeviceDirectory& directory, std::string_view devicePath,
               const Bytes& content) {
  writeFile(directory, devicePath, std::string(content.begin(), content.end()));
}

/// The answers of the controller, by tunnel opcode, each of which is a file.
Json writeControllerBuffers(const DeviceDirectory& directory, const Date& now) {
  Json answers;
  const auto add = [&](std::uint32_t opcode, const std::string& name, const Bytes& content,
                       const char* selector = nullptr, std::uint32_t selected = 0) {
    const std::string file = "controller/" + name + ".bin";
    writeFile(directory, file, content);
    Json& answer = answers.emplace_back(Json{{"opcode", opcode}});
    if (selector != nullptr) {
      answer[selector] = selected;
    }
    answer["file"] = file;
  };
  add(13, "statistics", sampleStatistics(now, 0));
  for (std::uint32_t index = 0; index < kMSPs; ++index) {
    add(221, "msp-" + std::to_string(index), sampleMSPStatistics(index), "argument", index);
  }
  for (const std::uint32_t hours : kMagazineHours) {
    add(10, "magazine-" + std::to_string(hours), sampleStatistics(now, hours), "argument", hours);
  }
  add(11, "validity", sampleValidity());
  for (std::uint32_t kind = 0; kind < kTelemetryKinds; ++kind) {
    add(17, "telemetry-" + std::to_string(kind), sampleTelemetry(kind), "kind", kind);
  }
  add(15, "defects", sampleDefects());
  return answers;
}

/// A kernel task whose one thread has swapped out 3 GiB.
Bytes kernelSnapshot() {
  return SnapshotBuilder()
      .begin(1)
      .begin(2)
      .name("VM_swapout", 64)
      .ioStatistics({0, 0, 49'152, 3ULL << 30})
      .end(2)
      .end(1)
      .bufferEnd()
      .bytes;
}

void writeECCEvents(const DeviceDirectory& directory) {
  int number = 0;
  for (const Json& event : sampleData().at("eccEvents")) {
    const Json& registers = event.at("registers");
    Bytes content{event.at("id").get<std::uint8_t>(), static_cast<std::uint8_t>(registers.size())};
    content.resize(8);
    for (const Json& value : registers) {
      appendLittleEndian(content, value.get<std::uint64_t>(), 8);
    }
    content.resize(72);
    writeFile(directory, "kernel/ecc/000" + std::to_string(++number) + ".bin", content);
  }
}

/// `counters`: bytes in and out over Wi-Fi, then over the wide-area network.
Json usageRecord(const char* nameKey, const std::string& name, std::int64_t since,
                 const Json& counters) {
  return {{nameKey, name},
          {"since", {{"date", dateText({since, 0})}}},
          {"wifiInBytes", counters[0]},
          {"wifiOutBytes", counters[1]},
          {"wwanInBytes", counters[2]},
          {"wwanOutBytes", counters[3]}};
}

/// The apps have counted for an hour; the network interfaces of this machine are processes that
/// have counted since its start.
Json usage(const Date& now) {
  Json records;
  for (const auto& [name, counters] : sampleData().at("apps").items()) {
    records.push_back(usageRecord("bundleName", name, now.seconds - 3600, counters));
  }
  if (const std::optional<std::int64_t> start = startOfSystem()) {
    for (const auto& [name, in, out] : readInterfaces()) {
      const bool isWideArea = name.starts_with("ww");
      records.push_back(
          usageRecord("procName", name, *start,
                      isWideArea ? Json::array({0, 0, in, out}) : Json::array({in, out, 0, 0})));
    }
  }
  return {{"records", records}};
}

/// A boot session with which the storage counters go into the daily log on the day of `now`, and on
/// every second day before and after it.
std::string bootSession(const Date& now) {
  const bool isOddDay = daysSince1970(now) % 2 != 0;
  return std::string(isOddDay ? "2" : "1") + "0F6D8A4-5B0C-4E4D-9D3A-6E2B7C1F0A55";
}

}  // namespace

void describeSampleDevice(const DeviceDirectory& directory, const Date& now) {
  constexpr std::string_view kSnapshotFile = "kernel/snapshot.bin";
  orFail([&](std::string& error) { return directory.makeFolder("controller", error); });
  const Json& data = sampleData();
  Json controller = data.at("controller");
  controller["userClient"]["tunnel"] = writeControllerBuffers(directory, now);
  writeFile(directory, kSnapshotFile, kernelSnapshot());
  writeECCEvents(directory);
  const Json description{
      {"kernel",
       {{"snapshot", kSnapshotFile}, {"variables", {{"kern.bootsessionuuid", bootSession(now)}}}}},
      {"purgeable", data.at("purgeable")},
      {"registry", Json::array({controller, data.at("nvram")})},
      {"channels", data.at("channels")},
      {"usage", usage(now)}};
  writeFile(directory, "device.json", description.dump(2) + '\n');
}

}  // namespace vesprun
