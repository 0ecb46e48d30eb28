#include "sample/SampleDescription.h"

#include <string>
#include <string_view>

#include "Command.h"
#include "common/LittleEndian.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/AtomicFile.h"
#include "sample/SampleController.h"
#include "sample/SampleTelemetry.h"

namespace vesprun {
namespace {

constexpr std::string_view kSnapshotFile = "kernel/snapshot.bin";

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

void appendItem(Bytes& snapshot, std::uint32_t type, std::uint64_t flags, const Bytes& data) {
  appendLittleEndian(snapshot, type, 4);
  appendLittleEndian(snapshot, data.size(), 4);
  appendLittleEndian(snapshot, flags, 8);
  snapshot.insert(snapshot.end(), data.begin(), data.end());
}

/// A kernel task whose one thread has swapped out 3 GiB.
Bytes kernelSnapshot() {
  constexpr std::uint32_t kContainerBegin = 19;
  constexpr std::uint32_t kContainerEnd = 20;
  constexpr std::uint32_t kThreadIOStatistics = 2305;
  constexpr std::uint32_t kThreadName = 2313;
  constexpr std::uint32_t kBufferEnd = 0xF19158ED;
  constexpr std::uint64_t kTask = 1;
  constexpr std::uint64_t kThread = 2;
  constexpr std::string_view kName = "VM_swapout";

  Bytes name(kName.begin(), kName.end());
  name.resize(64);
  Bytes counters;
  for (const std::uint64_t counter : {0ULL, 0ULL, 49'152ULL, 3ULL << 30}) {
    appendLittleEndian(counters, counter, 8);
  }
  Bytes snapshot;
  appendItem(snapshot, kContainerBegin, kTask, Bytes(4));
  appendItem(snapshot, kContainerBegin, kThread, Bytes(4));
  appendItem(snapshot, kThreadName, 0, name);
  appendItem(snapshot, kThreadIOStatistics, 0, counters);
  appendItem(snapshot, kContainerEnd, kThread, {});
  appendItem(snapshot, kContainerEnd, kTask, {});
  appendItem(snapshot, kBufferEnd, 0, {});
  return snapshot;
}

/// A boot session with which the storage counters go into the daily log on the day of `now`, and on
/// every second day before and after it.
std::string bootSession(const Date& now) {
  const bool isOddDay = daysSince1970(now) % 2 != 0;
  return std::string(isOddDay ? "2" : "1") + "0F6D8A4-5B0C-4E4D-9D3A-6E2B7C1F0A55";
}

}  // namespace

void describeSampleDevice(const DeviceDirectory& directory, const Date& now) {
  const PropertyDict controller = writeSampleController(directory, now);
  writeFile(directory, kSnapshotFile, kernelSnapshot());
  for (const SampleFile& file : sampleECCEvents()) {
    writeFile(directory, file.devicePath, file.content);
  }
  const PropertyDict variables{{"kern.bootsessionuuid", bootSession(now)}};
  const PropertyDict description{
      {"kernel", PropertyDict{{"snapshot", kSnapshotFile}, {"variables", variables}}},
      {"purgeable", PropertyDict{{"RECLAIMER_TOTAL_AVAILABLE", 4'310'708'224},
                                 {"RECLAIMER_NONPURGEABLE_AMOUNT", 31'138'512'896}}},
      {"registry", PropertyArray{controller, sampleNVRAMEntry()}},
      {"channels", sampleChannels()},
      {"usage", sampleUsage(now)}};
  writeFile(directory, "device.json", indentedJsonText(description) + '\n');
}

}  // namespace vesprun
