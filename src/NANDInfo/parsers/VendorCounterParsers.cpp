#include "NANDInfo/parsers/VendorCounterParsers.h"

#include <algorithm>
#include <cstring>

namespace vesprun {
namespace {

using enum CounterFieldId;

constexpr std::int16_t kSetToZero = -1;

/// The elements `first` to `last` of a field come from as many words of the region, from `source`
/// on.
struct CounterCopy {
  CounterFieldId field;
  std::uint8_t first;
  std::uint8_t last;
  std::int16_t source;

  constexpr std::size_t firstWord() const { return counterField(field).first + first; }
  constexpr std::size_t count() const { return last - first + std::size_t{1}; }
};

// clang-format off
constexpr CounterCopy kGeneric[] = {
    {ReadStage, 0, 18, 0},
    {ReadStage, 19, 19, 37},
    {ReadStage, 20, 21, 117},
    {ReadStage, 22, 22, 91},
    {InitialReadStage, 0, 7, 20},
    {InitialReadStage, 8, 8, 19},
    {InitialReadStage, 9, 9, 116},
    {InitialReadStage, 10, 10, 90},
    {InitialReadStage, 11, 11, 120},
    {InitialReadStage, 12, 12, 119},
    {NandStageOfLife, 0, 7, 28},
    {DspExceptionParameter, 0, 0, 104},
    {DspExceptionParameter, 1, 7, 38},
    {DspExceptionParameter, 8, 8, 89},
    {DspExceptionParameter, 9, 9, 105},
    {DspExceptionParameter, 10, 11, 114},
    {ReadStage18NumOfErrorsBin, 0, 11, 45},
    {ReadStage9NumOfErrorsBin, 0, 7, 57},
    {ReadStage10NumOfErrorsBin, 0, 9, 67},
    {ReadStage17NumOfErrorsBin, 0, 9, 77},
    {ReadStage19NumOfErrorsBin, 0, 11, 92},
    {AlgoNANDAccessesBin, 0, 7, 106},
};

constexpr CounterCopy kGenericKX4[] = {
    {ReadStage, 0, 7, 0},
    {ReadStage, 8, 8, kSetToZero},
    {ReadStage, 9, 18, 9},
    {ReadStage, 19, 19, 27},
    {ReadStage, 20, 21, 105},
    {ReadStage, 22, 22, 79},
    {ReadStage, 23, 24, kSetToZero},
    {ReadStage, 25, 28, 115},
    {ReadStage, 29, 29, 8},
    {ReadStage, 30, 31, 120},
    {ReadStage, 32, 32, 110},
    {InitialReadStage, 0, 7, kSetToZero},
    {InitialReadStage, 8, 8, 19},
    {InitialReadStage, 9, 9, 104},
    {InitialReadStage, 10, 10, 78},
    {InitialReadStage, 11, 11, 108},
    {InitialReadStage, 12, 12, 107},
    {InitialReadStage, 13, 13, 122},
    {NandStageOfLife, 0, 2, 20},
    {NandStageOfLife, 3, 3, kSetToZero},
    {NandStageOfLife, 4, 6, 23},
    {NandStageOfLife, 7, 7, kSetToZero},
    {DspExceptionParameter, 0, 0, 92},
    {DspExceptionParameter, 1, 2, 28},
    {DspExceptionParameter, 3, 8, kSetToZero},
    {DspExceptionParameter, 9, 9, 93},
    {DspExceptionParameter, 10, 11, 102},
    {DspExceptionParameter, 12, 12, kSetToZero},
    {DspExceptionParameter, 13, 15, 30},
    {DspExceptionParameter, 16, 16, 77},
    {DspExceptionParameter, 17, 19, 112},
    {DspExceptionParameter, 20, 20, 126},
    {DspExceptionParameter, 21, 21, 123},
    {DspExceptionParameter, 22, 26, 94},
    {DspExceptionParameter, 27, 27, kSetToZero},
    {DspExceptionParameter, 28, 30, 99},
    {DspExceptionParameter, 31, 31, 109},
    {DspExceptionParameter, 32, 32, 111},
    {DspExceptionParameter, 33, 36, 45},
    {DspExceptionParameter, 37, 37, 26},
    {ReadStage18NumOfErrorsBin, 0, 11, 33},
    {ReadStage9NumOfErrorsBin, 0, 7, kSetToZero},
    {ReadStage10NumOfErrorsBin, 0, 9, 55},
    {ReadStage17NumOfErrorsBin, 0, 9, 65},
    {ReadStage19NumOfErrorsBin, 0, 11, 80},
    {RetentionIndication, 0, 1, kSetToZero},
    {RetentionIndication, 2, 3, 75},
    {RetentionIndication, 4, 11, kSetToZero},
};

constexpr CounterCopy k1y[] = {
    {ReadStage, 0, 7, 256},
    {ReadStage, 8, 8, 265},
    {ReadStage, 9, 18, 267},
    {ReadStage, 19, 19, 303},
    {ReadStage, 20, 21, 390},
    {ReadStage, 22, 22, 372},
    {InitialReadStage, 0, 7, 278},
    {InitialReadStage, 8, 8, 277},
    {InitialReadStage, 9, 9, 290},
    {InitialReadStage, 10, 10, 371},
    {InitialReadStage, 11, 11, 393},
    {InitialReadStage, 12, 12, 392},
    {NandStageOfLife, 0, 7, 292},
    {DspExceptionParameter, 0, 0, 21},
    {DspExceptionParameter, 1, 2, 305},
    {DspExceptionParameter, 3, 7, 313},
    {DspExceptionParameter, 8, 8, 370},
    {DspExceptionParameter, 9, 9, 15},
    {DspExceptionParameter, 10, 11, 531},
    {ReadStage18NumOfErrorsBin, 0, 11, 318},
    {ReadStage9NumOfErrorsBin, 0, 7, 330},
    {ReadStage10NumOfErrorsBin, 0, 9, 338},
    {ReadStage17NumOfErrorsBin, 0, 9, 348},
    {ReadStage19NumOfErrorsBin, 0, 11, 373},
};

constexpr CounterCopy k1xSandisk[] = {
    {ReadStage, 0, 5, 256},
    {ReadStage, 6, 7, kSetToZero},
    {ReadStage, 8, 8, 265},
    {ReadStage, 9, 15, 267},
    {ReadStage, 16, 16, kSetToZero},
    {ReadStage, 17, 18, 275},
    {ReadStage, 19, 19, 301},
    {ReadStage, 20, 22, kSetToZero},
    {InitialReadStage, 0, 5, 278},
    {InitialReadStage, 6, 7, kSetToZero},
    {InitialReadStage, 8, 8, 277},
    {InitialReadStage, 9, 9, 288},
    {InitialReadStage, 10, 12, kSetToZero},
    {NandStageOfLife, 0, 7, 290},
    {DspExceptionParameter, 0, 0, 16},
    {DspExceptionParameter, 1, 2, 303},
    {DspExceptionParameter, 3, 7, 311},
    {DspExceptionParameter, 8, 8, kSetToZero},
    {DspExceptionParameter, 9, 9, 10},
    {DspExceptionParameter, 10, 11, kSetToZero},
};

constexpr CounterCopy k1xHynix[] = {
    {ReadStage, 0, 3, 256},
    {ReadStage, 4, 7, kSetToZero},
    {ReadStage, 8, 8, 263},
    {ReadStage, 9, 15, 265},
    {ReadStage, 16, 16, kSetToZero},
    {ReadStage, 17, 18, 273},
    {ReadStage, 19, 19, 297},
    {ReadStage, 20, 22, kSetToZero},
    {InitialReadStage, 0, 3, 276},
    {InitialReadStage, 4, 7, kSetToZero},
    {InitialReadStage, 8, 8, 275},
    {InitialReadStage, 9, 9, 284},
    {InitialReadStage, 10, 12, kSetToZero},
    {NandStageOfLife, 0, 7, 286},
    {DspExceptionParameter, 0, 0, 16},
    {DspExceptionParameter, 1, 2, 299},
    {DspExceptionParameter, 3, 7, 307},
    {DspExceptionParameter, 8, 8, kSetToZero},
    {DspExceptionParameter, 9, 9, 10},
    {DspExceptionParameter, 10, 11, kSetToZero},
};
// clang-format on

/// The number of words that a layout writes; 0 when it writes one twice or out of order, leaves a
/// field, or reads past the region.
constexpr std::size_t wordsOf(std::span<const CounterCopy> layout) {
  std::size_t words = 0;
  std::size_t end = 0;
  for (const CounterCopy& copy : layout) {
    if (copy.firstWord() < end || copy.first > copy.last ||
        copy.last >= counterField(copy.field).count || copy.source < kSetToZero ||
        static_cast<std::size_t>(copy.source + 1) + copy.count() - 1 > kCounterRegionWords) {
      return 0;
    }
    words += copy.count();
    end = copy.firstWord() + copy.count();
  }
  return words;
}

static_assert(wordsOf(kGeneric) == 116);
static_assert(wordsOf(kGenericKX4) == 157);
static_assert(wordsOf(k1y) == 108);
static_assert(wordsOf(k1xSandisk) == 56);
static_assert(wordsOf(k1xHynix) == 56);

void copyCounters(std::span<const CounterCopy> layout, CounterRegion region,
                  NandChannelCounters& out) {
  for (const CounterCopy& copy : layout) {
    const auto words = std::span(out).subspan(copy.firstWord(), copy.count());
    if (copy.source == kSetToZero) {
      std::ranges::fill(words, 0);
    } else {
      std::memcpy(words.data(),
                  region.data() + static_cast<std::size_t>(copy.source) * sizeof(std::uint32_t),
                  words.size_bytes());
    }
  }
}

}  // namespace

void parseCountersAlgoGeneric(CounterRegion region, NandChannelCounters& out) {
  parseOnlyAlgoGenericCounters(region, out);
}

void parseCountersAlgoGenericKX4(CounterRegion region, NandChannelCounters& out) {
  parseOnlyAlgoGenericCountersKX4(region, out);
}

void parseCounters1y(CounterRegion region, NandChannelCounters& out) {
  copyCounters(k1y, region, out);
}

void parseCounters1xSandisk(CounterRegion region, NandChannelCounters& out) {
  copyCounters(k1xSandisk, region, out);
}

void parseCounters1xHynix(CounterRegion region, NandChannelCounters& out) {
  copyCounters(k1xHynix, region, out);
}

void parseOnlyAlgoGenericCounters(CounterRegion region, NandChannelCounters& out) {
  copyCounters(kGeneric, region, out);
}

void parseOnlyAlgoGenericCountersKX4(CounterRegion region, NandChannelCounters& out) {
  copyCounters(kGenericKX4, region, out);
}

}  // namespace vesprun
