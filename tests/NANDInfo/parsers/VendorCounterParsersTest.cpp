#include "NANDInfo/parsers/VendorCounterParsers.h"

#include <gmock/gmock.h>

#include <map>
#include <numeric>

#include "buffers/DeviceBuffers.h"

namespace vesprun {
namespace {

TEST(VendorCounterParsers, CopyWhatTheirLayoutsSay) {
  struct Case {
    void (*parse)(CounterRegion, NandChannelCounters&);
    std::uint64_t sum;
    std::size_t untouched;
    std::map<std::size_t, std::uint32_t> words;
  };
  const Case cases[] = {
      {parseCountersAlgoGeneric,
       6918,
       61,
       {{19, 37}, {20, 117}, {41, 19}, {65, 104}, {122, 64}, {123, 0}, {125, 67}, {164, 113}}},
      {parseCountersAlgoGenericKX4,
       7324,
       20,
       {{8, 0}, {29, 8}, {86, 123}, {102, 26}, {144, 74}, {167, 75}, {168, 76}, {176, 0}}},
      {parseCounters1y,
       34548,
       69,
       {{7, 263}, {8, 265}, {9, 267}, {42, 290}, {65, 21}, {74, 15}, {76, 532}, {156, 384}}},
      {parseCounters1xSandisk,
       11352,
       121,
       {{5, 261}, {6, 0}, {8, 265}, {19, 301}, {42, 288}, {63, 297}, {65, 16}, {74, 10}, {77, 0}}},
      {parseCounters1xHynix,
       10168,
       121,
       {{3, 259}, {4, 0}, {8, 263}, {18, 274}, {42, 284}, {63, 293}, {72, 311}, {74, 10}, {77, 0}}},
  };
  const Bytes list = telemetryList(1);  // word i of its region holds i
  const CounterRegion region = std::span(list).first<kCounterRegionSize>();
  for (const Case& each : cases) {
    const std::size_t number = static_cast<std::size_t>(&each - cases);
    NandChannelCounters counters{};
    each.parse(region, counters);
    for (const auto& [word, value] : each.words) {
      EXPECT_EQ(counters[word], value) << "layout " << number << ", word " << word;
    }
    EXPECT_EQ(std::accumulate(counters.begin(), counters.end(), std::uint64_t{0}), each.sum)
        << "layout " << number;
    counters.fill(0xFFFF);
    each.parse(region, counters);
    EXPECT_EQ(static_cast<std::size_t>(std::count(counters.begin(), counters.end(), 0xFFFFU)),
              each.untouched)
        << "layout " << number;
  }
}

}  // namespace
}  // namespace vesprun
