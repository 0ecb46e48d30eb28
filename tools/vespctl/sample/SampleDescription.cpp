#include "sample/SampleDescription.h"

#include <string>
#include <string_view>

#include "Command.h"
#include "buffers/DeviceBuffers.h"
#include "common/LittleEndian.h"
#include "platform/host/files/AtomicFile.h"
#include "sample/SampleBuffers.h"
#include "sample/SampleCounters.h"
#include "sample/SampleData.h"

namespace vesprun {
namespace {

using Json = nlohmann::ordered_json;

constexpr std::uint32_t kMSPs = 2;
constexpr std::uint32_t kTelemetryKinds = 3;

/// The snapshots that the magazine holds, in hours back.
constexpr std::uint32_t kMagazineHours[] = {0, 4, 8, 12, 16, 20, 24, 168, 720};

void writeFile(const DeviceDirectory& directory, std::string_view devicePath,
               std::string_view content) {
  std::string error;
  if (!replaceFile(directory.hostPath(devicePath), content, error)) {
    throw CommandFailure(error);
  }
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
  if (const std::optional<std::int64_t> start = readSchedulerFigure("btime")) {
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
  std::string error;
  if (!directory.makeFolder("controller", error)) {
    throw CommandFailure(error);
  }
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
