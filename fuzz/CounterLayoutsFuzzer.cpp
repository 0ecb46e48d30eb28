#include <unordered_set>

#include "ExactCopy.h"
#include "NANDInfo/parsers/VendorCounterParsers.h"
#include "Require.h"
#include "common/LittleEndian.h"

using namespace vesprun;

/// Every layout of a region: a word of the result is one of the region's, or 0, and the layout
/// writes the same words whatever they hold. A shorter input is a region that ends in zeros.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  std::array<std::uint8_t, kCounterRegionSize> padded{};
  std::copy_n(bytes, std::min(size, padded.size()), padded.begin());
  const ExactCopy buffer(padded.data(), padded.size());
  const CounterRegion region = buffer.span().first<kCounterRegionSize>();

  std::unordered_set<std::uint32_t> words{0};
  for (std::size_t at = 0; at < region.size(); at += sizeof(std::uint32_t)) {
    words.insert(loadLittleEndian<std::uint32_t>(region.data() + at));
  }
  for (const auto parse : {parseCountersAlgoGeneric, parseCountersAlgoGenericKX4, parseCounters1y,
                           parseCounters1xSandisk, parseCounters1xHynix}) {
    NandChannelCounters counters{};
    parse(region, counters);
    NandChannelCounters again = counters;
    parse(region, again);
    require(counters == again, "a layout writes the same words again");
    for (const std::uint32_t counter : counters) {
      require(words.contains(counter), "a counter is a word of the region");
    }
  }
  return 0;
}
