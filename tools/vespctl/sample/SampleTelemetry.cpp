#include "sample/SampleTelemetry.h"

#include <optional>
#include <span>
#include <string_view>

#include "common/LittleEndian.h"
#include "sample/SampleCounters.h"

namespace vesprun {
namespace {

PropertyDict usageRecord(const char* nameKey, std::string_view name, std::int64_t since,
                         const std::int64_t (&counters)[4]) {
  return {{nameKey, name},
          {"since", Date{since, 0}},
          {"wifiInBytes", counters[0]},
          {"wifiOutBytes", counters[1]},
          {"wwanInBytes", counters[2]},
          {"wwanOutBytes", counters[3]}};
}

PropertyDict interfaceRecord(const InterfaceReading& interface, std::int64_t since) {
  const auto& [name, in, out] = interface;
  if (name.starts_with("ww")) {  // wireless wide-area interfaces are named so
    return usageRecord("procName", name, since, {0, 0, in, out});
  }
  return usageRecord("procName", name, since, {in, out, 0, 0});
}

Bytes eccEvent(std::uint8_t identifier, std::span<const std::uint64_t> registers) {
  Bytes event{identifier, static_cast<std::uint8_t>(registers.size())};
  event.resize(8);
  for (const std::uint64_t value : registers) {
    appendLittleEndian(event, value, sizeof value);
  }
  event.resize(72);
  return event;
}

}  // namespace

PropertyArray sampleChannels() {
  return {PropertyDict{{"name", "TempMax"}, {"value", 41}},
          PropertyDict{{"name", "TempMin"}, {"value", 19}},
          PropertyDict{{"name", "FanStarts"}, {"value", 3}},
          PropertyDict{{"name", "WakeHistogram"}, {"value", 0}, {"format", 3}},
          PropertyDict{{"name", "DisplayFrames"}, {"value", 88120}, {"categories", 1}}};
}

PropertyDict sampleNVRAMEntry() {
  const PropertyDict bank{{"class", "DevRegNVRAMBank"},
                          {"properties", PropertyDict{{"Generation", 1234}, {"Version", 2}}}};
  return {{"class", "DevRegDTNVRAMDiags"},
          {"properties", PropertyDict{{"CommonUsed", 2411}, {"SystemUsed", 871}}},
          {"children", PropertyArray{bank}}};
}

PropertyDict sampleUsage(const Date& now) {
  constexpr std::int64_t kHour = 3600;
  PropertyArray records{usageRecord("bundleName", "org.example.reader", now.seconds - kHour,
                                    {48'210'944, 1'204'224, 3'145'728, 90'112}),
                        usageRecord("bundleName", "org.example.messages", now.seconds - kHour,
                                    {912'384, 655'360, 204'800, 1'023})};
  if (const std::optional<std::int64_t> start = readSchedulerFigure("btime")) {
    for (const InterfaceReading& interface : readInterfaces()) {
      records.emplace_back(interfaceRecord(interface, *start));
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
