#include "NANDInfo/parsers/VendorCounterParsers.h"

#include "common/LittleEndian.h"

namespace vesprun {
namespace {

constexpr std::int16_t kSetToZero = -1;

/// The words `first` to `last` of the record come from as many words of the region, from `source`
/// on.
struct CounterCopy {
  std::int16_t first;
  std::int16_t last;
  std::int16_t source;
};

constexpr CounterCopy kGeneric[] = {
    {0, 18, 0},       // readStage[0-18]
    {19, 19, 37},     // readStage[19]
    {20, 21, 117},    // readStage[20-21]
    {22, 22, 91},     // readStage[22]
    {33, 40, 20},     // initialReadStage[0-7]
    {41, 41, 19},     // initialReadStage[8]
    {42, 42, 116},    // initialReadStage[9]
    {43, 43, 90},     // initialReadStage[10]
    {44, 44, 120},    // initialReadStage[11]
    {45, 45, 119},    // initialReadStage[12]
    {56, 63, 28},     // nandStageOfLife[0-7]
    {65, 65, 104},    // dspExceptionParameter[0]
    {66, 72, 38},     // dspExceptionParameter[1-7]
    {73, 73, 89},     // dspExceptionParameter[8]
    {74, 74, 105},    // dspExceptionParameter[9]
    {75, 76, 114},    // dspExceptionParameter[10-11]
    {103, 122, 45},   // readStage18NumOfErrorsBin[0-11], readStage9NumOfErrorsBin[0-7]
    {125, 144, 67},   // readStage10NumOfErrorsBin[0-9], readStage17NumOfErrorsBin[0-9]
    {145, 156, 92},   // readStage19NumOfErrorsBin[0-11]
    {157, 164, 106},  // algoNANDAccessesBin[0-7]
};

constexpr CounterCopy kGenericKX4[] = {
    {0, 7, 0},               // readStage[0-7]
    {8, 8, kSetToZero},      // readStage[8]
    {9, 18, 9},              // readStage[9-18]
    {19, 19, 27},            // readStage[19]
    {20, 21, 105},           // readStage[20-21]
    {22, 22, 79},            // readStage[22]
    {23, 24, kSetToZero},    // readStage[23-24]
    {25, 28, 115},           // readStage[25-28]
    {29, 29, 8},             // readStage[29]
    {30, 31, 120},           // readStage[30-31]
    {32, 32, 110},           // readStage[32]
    {33, 40, kSetToZero},    // initialReadStage[0-7]
    {41, 41, 19},            // initialReadStage[8]
    {42, 42, 104},           // initialReadStage[9]
    {43, 43, 78},            // initialReadStage[10]
    {44, 44, 108},           // initialReadStage[11]
    {45, 45, 107},           // initialReadStage[12]
    {46, 46, 122},           // initialReadStage[13]
    {56, 58, 20},            // nandStageOfLife[0-2]
    {59, 59, kSetToZero},    // nandStageOfLife[3]
    {60, 62, 23},            // nandStageOfLife[4-6]
    {63, 63, kSetToZero},    // nandStageOfLife[7]
    {65, 65, 92},            // dspExceptionParameter[0]
    {66, 67, 28},            // dspExceptionParameter[1-2]
    {68, 73, kSetToZero},    // dspExceptionParameter[3-8]
    {74, 74, 93},            // dspExceptionParameter[9]
    {75, 76, 102},           // dspExceptionParameter[10-11]
    {77, 77, kSetToZero},    // dspExceptionParameter[12]
    {78, 80, 30},            // dspExceptionParameter[13-15]
    {81, 81, 77},            // dspExceptionParameter[16]
    {82, 84, 112},           // dspExceptionParameter[17-19]
    {85, 85, 126},           // dspExceptionParameter[20]
    {86, 86, 123},           // dspExceptionParameter[21]
    {87, 91, 94},            // dspExceptionParameter[22-26]
    {92, 92, kSetToZero},    // dspExceptionParameter[27]
    {93, 95, 99},            // dspExceptionParameter[28-30]
    {96, 96, 109},           // dspExceptionParameter[31]
    {97, 97, 111},           // dspExceptionParameter[32]
    {98, 101, 45},           // dspExceptionParameter[33-36]
    {102, 102, 26},          // dspExceptionParameter[37]
    {103, 114, 33},          // readStage18NumOfErrorsBin[0-11]
    {115, 122, kSetToZero},  // readStage9NumOfErrorsBin[0-7]
    {125, 144, 55},          // readStage10NumOfErrorsBin[0-9], readStage17NumOfErrorsBin[0-9]
    {145, 156, 80},          // readStage19NumOfErrorsBin[0-11]
    {165, 166, kSetToZero},  // retentionIndication[0-1]
    {167, 168, 75},          // retentionIndication[2-3]
    {169, 176, kSetToZero},  // retentionIndication[4-11]
};

constexpr CounterCopy k1y[] = {
    {0, 7, 256},      // readStage[0-7]
    {8, 8, 265},      // readStage[8]
    {9, 18, 267},     // readStage[9-18]
    {19, 19, 303},    // readStage[19]
    {20, 21, 390},    // readStage[20-21]
    {22, 22, 372},    // readStage[22]
    {33, 40, 278},    // initialReadStage[0-7]
    {41, 41, 277},    // initialReadStage[8]
    {42, 42, 290},    // initialReadStage[9]
    {43, 43, 371},    // initialReadStage[10]
    {44, 44, 393},    // initialReadStage[11]
    {45, 45, 392},    // initialReadStage[12]
    {56, 63, 292},    // nandStageOfLife[0-7]
    {65, 65, 21},     // dspExceptionParameter[0]
    {66, 67, 305},    // dspExceptionParameter[1-2]
    {68, 72, 313},    // dspExceptionParameter[3-7]
    {73, 73, 370},    // dspExceptionParameter[8]
    {74, 74, 15},     // dspExceptionParameter[9]
    {75, 76, 531},    // dspExceptionParameter[10-11]
    {103, 122, 318},  // readStage18NumOfErrorsBin[0-11], readStage9NumOfErrorsBin[0-7]
    {125, 144, 338},  // readStage10NumOfErrorsBin[0-9], readStage17NumOfErrorsBin[0-9]
    {145, 156, 373},  // readStage19NumOfErrorsBin[0-11]
};

constexpr CounterCopy k1xSandisk[] = {
    {0, 5, 256},           // readStage[0-5]
    {6, 7, kSetToZero},    // readStage[6-7]
    {8, 8, 265},           // readStage[8]
    {9, 15, 267},          // readStage[9-15]
    {16, 16, kSetToZero},  // readStage[16]
    {17, 18, 275},         // readStage[17-18]
    {19, 19, 301},         // readStage[19]
    {20, 22, kSetToZero},  // readStage[20-22]
    {33, 38, 278},         // initialReadStage[0-5]
    {39, 40, kSetToZero},  // initialReadStage[6-7]
    {41, 41, 277},         // initialReadStage[8]
    {42, 42, 288},         // initialReadStage[9]
    {43, 45, kSetToZero},  // initialReadStage[10-12]
    {56, 63, 290},         // nandStageOfLife[0-7]
    {65, 65, 16},          // dspExceptionParameter[0]
    {66, 67, 303},         // dspExceptionParameter[1-2]
    {68, 72, 311},         // dspExceptionParameter[3-7]
    {73, 73, kSetToZero},  // dspExceptionParameter[8]
    {74, 74, 10},          // dspExceptionParameter[9]
    {75, 76, kSetToZero},  // dspExceptionParameter[10-11]
};

constexpr CounterCopy k1xHynix[] = {
    {0, 3, 256},           // readStage[0-3]
    {4, 7, kSetToZero},    // readStage[4-7]
    {8, 8, 263},           // readStage[8]
    {9, 15, 265},          // readStage[9-15]
    {16, 16, kSetToZero},  // readStage[16]
    {17, 18, 273},         // readStage[17-18]
    {19, 19, 297},         // readStage[19]
    {20, 22, kSetToZero},  // readStage[20-22]
    {33, 36, 276},         // initialReadStage[0-3]
    {37, 40, kSetToZero},  // initialReadStage[4-7]
    {41, 41, 275},         // initialReadStage[8]
    {42, 42, 284},         // initialReadStage[9]
    {43, 45, kSetToZero},  // initialReadStage[10-12]
    {56, 63, 286},         // nandStageOfLife[0-7]
    {65, 65, 16},          // dspExceptionParameter[0]
    {66, 67, 299},         // dspExceptionParameter[1-2]
    {68, 72, 307},         // dspExceptionParameter[3-7]
    {73, 73, kSetToZero},  // dspExceptionParameter[8]
    {74, 74, 10},          // dspExceptionParameter[9]
    {75, 76, kSetToZero},  // dspExceptionParameter[10-11]
};

/// The number of words that a layout writes; 0 when it writes one twice, out of order, or one that
/// there is not, or reads behind the region.
constexpr int wordsOf(std::span<const CounterCopy> layout) {
  int words = 0;
  int previous = -1;
  for (const CounterCopy& copy : layout) {
    const int count = copy.last - copy.first + 1;
    if (copy.first <= previous || count < 1 || copy.last >= int{kNandChannelCounterCount} ||
        copy.source < kSetToZero || copy.source + count > int{kCounterRegionWords}) {
      return 0;
    }
    words += count;
    previous = copy.last;
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
    for (int word = copy.first; word <= copy.last; ++word) {
      const auto source = static_cast<std::size_t>(copy.source + word - copy.first);
      out[static_cast<std::size_t>(word)] =
          copy.source == kSetToZero
              ? 0
              : loadLittleEndian<std::uint32_t>(region.data() + source * sizeof(std::uint32_t));
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
