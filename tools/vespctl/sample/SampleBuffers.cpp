#include "sample/SampleBuffers.h"

#include <string_view>
#include <vector>

#include "buffers/DeviceBuffers.h"
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
Values valuesOf(const nlohmann::ordered_json& figures, std::string_view name, std::size_t count,
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

}  // namespace

Bytes sampleStatistics(const Date& now, std::uint64_t hoursBack) {
  const auto nowSeconds = static_cast<std::uint64_t>(now.seconds);
  const std::uint64_t takenAt = nowSeconds - hoursBack * kSecondsPerHour;
  nlohmann::ordered_json figures = sampleData().at("statistics");
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

}  // namespace vesprun
