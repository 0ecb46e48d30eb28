#include <numeric>

#include <gmock/gmock.h>

#include "FieldsOf.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "buffers/DeviceBuffers.h"
#include "common/ProcessState.h"

namespace vesprun {
namespace {

using Words = std::vector<std::uint64_t>;

Words countingUp(std::size_t count, std::uint64_t first = 0) {
  Words words(count);
  std::iota(words.begin(), words.end(), first);
  return words;
}

/// The text of the elements of an array.
std::string numbered(const std::string& name, std::size_t count, std::uint64_t first = 0) {
  std::string text;
  for (std::size_t i = 0; i < count; ++i) {
    text += ' ' + name + std::to_string(i) + '=' + std::to_string(first + i);
  }
  return text;
}

struct Outcome {
  std::uint32_t result = 0;
  Fields fields;
  std::string error;
};

template <auto parse>
Outcome outcomeOf(std::span<const std::uint8_t> buffer) {
  ProcessState::startAfresh();
  GenericParserCxt ctx;
  const std::uint32_t result = parse(ctx, buffer);
  return {result, fieldsOf(ctx), GetAPIErrorMessage()};
}
constexpr auto ftlOutcome = outcomeOf<ORUFTLParseBufferToCxt>;
constexpr auto ftlStatKey = outcomeOf<ORUFTLParseStatKeyBufferToCxt>;
constexpr auto mspOutcome = outcomeOf<ORUMSPParseBufferToCxt>;

Outcome base(std::span<const std::uint8_t> buffer) {
  ProcessState::startAfresh();
  ORUStatsContext ctx;
  const bool result = ORUParseBufferToCxt(ctx, buffer);
  return {result, fieldsOf(ctx.fields), GetAPIErrorMessage()};
}

using Statistics = StatisticsBufferBuilder;
using MSP = MSPBufferBuilder;

/// The result, " name=value" of each field, and the error if there is one.
template <typename Builder>
std::string textOf(Outcome (*parse)(std::span<const std::uint8_t>), const Builder& builder) {
  // NOLINTNEXTLINE(performance-unnecessary-copy-initialization): one with nothing behind it
  const Bytes exact = builder.bytes();
  const Outcome outcome = parse(exact);
  std::string text = std::to_string(outcome.result);
  for (const auto& [name, value] : outcome.fields) {
    text += ' ' + name + '=' + std::to_string(value);
  }
  return outcome.error == "NA" ? text : text + ": " + outcome.error;
}

TEST(BaseParser, WalksRecords) {
  const std::pair<Statistics, std::string> cases[] = {
      {Statistics(), "0"},
      {Statistics().add(900, {}), "1"},
      {Statistics()
           .add(0, {1})
           .add(21, {1, 2})
           .add(ORUStatKeyTable.back().id + 1U, {})
           .add(0x30000000, {9}),
       "1"},
      {Statistics().add(4, {5}).add(0x30000001, {}).add(7, {1}), "0 hostWrites=5"},
      {Statistics().add(7, {6}).addHeader(4, 2).addWord(1), "0 hostReads=6"},
      {Statistics().add(90, countingUp(200)).add(4, {1, 2, 3}),
       "1" + numbered("qosPerCmdQ", 160) + " hostWrites=1"},
      {Statistics().add(1, {1}).add(1, {2}), "1 version=1 version=2"},
      {Statistics().add(4, {}).add(900, {}), "1 hostWrites=900"},  // from the next record
      {Statistics().add(113, {10, 11}).addHeader(18, 0),           // and none behind the end
       "1 bandsPerHostFlow0=10 bandsPerHostFlow1=11 bandsPerHostFlow2=18"},
      {Statistics().add(113, {10}), "1 bandsPerHostFlow0=10"},
      {Statistics().add(113, {}), "1"}};
  for (const auto& [buffer, expected] : cases) {
    EXPECT_EQ(textOf(base, buffer), expected);
  }
  EXPECT_EQ(base(Bytes(7)).result, 0U);
  Bytes trailing = Statistics().add(4, {5}).bytes();
  trailing.resize(trailing.size() + 4, 1);
  EXPECT_EQ(base(trailing).result, 1U);
}

TEST(BaseParser, GivesUpOnlyWhenRecordsThatOverlapMultiplyFields) {
  constexpr std::uint32_t kCacheDepthVsThroughput = 460;  // 256 elements
  Statistics overlapping;
  for (int record = 0; record < 32'768; ++record) {
    overlapping.addHeader(kCacheDepthVsThroughput, 0);
  }
  ORUStatsContext ctx;
  EXPECT_FALSE(ORUParseBufferToCxt(ctx, overlapping.bytes()));
  EXPECT_EQ(ctx.fields.size(), 1025U * 256);

  Statistics full;
  for (int record = 0; record < 4'000; ++record) {
    full.add(kCacheDepthVsThroughput, Words(256));
  }
  full.add(kCacheDepthVsThroughput, {}).add(4, Words(300));
  EXPECT_TRUE(ORUParseBufferToCxt(ctx, full.bytes()));  // adds to what a parse before it left
  EXPECT_EQ(ctx.fields.size(), 1025U * 256 + 4001U * 256 + 1);
}

/// In the order of the context, without the driver version and the histogram.
Words summaryOf(const ORUStatsContext& ctx) {
  Words values;
  for (const ORUSummaryField& field : kORUSummaryFields) {
    values.push_back(field.get(ctx));
  }
  return values;
}

TEST(BaseParser, FillsTheSummary) {
  // In the order of the context, and a histogram at the end.
  const Words ids = {53, 52, 51, 50, 49, 7, 4, 48, 17, 19, 18, 20, 12, 13, 56, 28, 45};
  Words all(ids.size());
  Statistics rising;
  Statistics falling;
  for (std::uint32_t id = 0; id <= 100; ++id) {
    const auto at = static_cast<std::size_t>(std::find(ids.begin(), ids.end(), id) - ids.begin());
    if (at < ids.size()) {
      all[at] = id + (id >= 49 && id <= 53 ? 0U : 0x500000000U);
    }
    rising.add(id, {0x500000000U + id});
    falling.add(100 - id, {0x500000000U + 100 - id});
  }
  ORUStatsContext ctx;
  EXPECT_TRUE(ORUParseBufferToCxt(ctx, rising.bytes()));
  EXPECT_EQ(summaryOf(ctx), all);
  EXPECT_EQ(ctx.readCountHisto, (std::array<std::uint64_t, 5>{}));
  ORUReleaseContext(ctx);
  EXPECT_EQ(summaryOf(ctx), Words(ids.size()));
  EXPECT_EQ(ctx.driverVersion, 0);
  EXPECT_TRUE(ORUParseBufferToCxt(ctx, falling.add(265, {1, 2, 3, 4, 5}).bytes()));
  EXPECT_EQ(summaryOf(ctx), all);
  EXPECT_THAT(ctx.readCountHisto, ::testing::ElementsAre(1, 2, 3, 4, 5));
  EXPECT_EQ(ctx.driverVersion, -1);
  const std::size_t fieldCount = ctx.fields.size();

  // A later parse adds; a failing one takes back the export version only.
  EXPECT_FALSE(ORUParseBufferToCxt(ctx, Bytes(7)));
  EXPECT_EQ(ctx.exportVersion, 53U);
  EXPECT_FALSE(ORUParseBufferToCxt(ctx, Statistics().add(4, {8}).addHeader(4, 1).bytes()));
  EXPECT_EQ(ctx.exportVersion, 0U);
  EXPECT_EQ(ctx.hostWrites, 8U);
  EXPECT_EQ(ctx.hostReads, 0x500000007U);
  EXPECT_EQ(ctx.fields.size(), fieldCount + 1);
}

TEST(FTLParser, WalksRecords) {
  const std::string tooMany = ": ORUFTLParseBufferToCxt 900: Cannot add 65536 elements to context";
  const std::string counts = ": ORUFTLParseBufferToCxt: qosPerCmdQ(90): (#160) cfg elements != ";
  const Statistics large = Statistics().add(11, {1}).add(900, Words(65'536)).add(11, {2});
  const std::pair<Statistics, std::string> cases[] = {
      {Statistics(), "0"},
      {Statistics().add(11, {}), "0"},
      {Statistics().add(65535, {}).add(0xFFFFFFFF, {}).add(11, {3}), "1 uncleanBoots=3"},
      {Statistics().add(11, {7, 8, 9}).add(4, {1}), "2 uncleanBoots=7 hostWrites=1"},
      {Statistics().add(14, countingUp(10)), "10" + numbered("hostWriteLogHisto_", 10)},
      {Statistics().add(90, countingUp(200)).add(14, countingUp(2, 5)),  // the first error of two
       "162" + numbered("qosPerCmdQ_", 160) + numbered("hostWriteLogHisto_", 2, 5) + counts +
           "(200) buffer elements"},
      {Statistics().add(90, {4}), "1 qosPerCmdQ_=4" + counts + "(1) buffer elements"},
      {Statistics().add(74, {1}).add(74, {1, 2, 3}).add(0x30000000, {5}),
       "5 Stat_74=1 Stat_74_0=1 Stat_74_1=2 Stat_74_2=3 Stat_805306368=5"},
      {Statistics().add(4, {1}).add(0x30000001, {2}).add(7, {3}), "1 hostWrites=1"},
      {Statistics().add(4, {1}).add(65535, {2}).add(7, {3}), "1 hostWrites=1"},
      {Statistics().add(4, {1}).addHeader(74, 2).addWord(1), "1 hostWrites=1"},
      {large, "1 uncleanBoots=1" + tooMany}};
  for (const auto& [buffer, expected] : cases) {
    EXPECT_EQ(textOf(ftlOutcome, buffer), expected);
  }
  EXPECT_EQ(textOf(ftlStatKey, Statistics().add(11, {7}).add(14, countingUp(10))),
            "11 Stat_11=7" + numbered("Stat_14_", 10));
  EXPECT_EQ(textOf(ftlStatKey, large), "1 Stat_11=1" + tooMany);
  EXPECT_EQ(textOf(ftlStatKey, Statistics().add(65535, {2}).add(7, {3})), "0");
}

TEST(MSPParser, WalksRecords) {
  const auto mismatch = [](const std::string& key, const std::string& configured,
                           const std::string& size) {
    return ": ORUMSPParseBufferToCxt: " + key + ": cfg " + configured + " cfg bytes != (" + size +
           ") buffer bytes";
  };
  const std::pair<MSP, std::string> cases[] = {
      {MSP(), "0: ORUMSPParseBufferToCxt: Passed in invalid buffer or empty buffer"},
      {MSP().addHeader(0x2FFF, 4), "0"},
      {MSP().add(4096, {7}).addBytes(3), "1 passWithTmodeHard=7"},
      {MSP().add(4120, countingUp(12)),
       "11" + numbered("FS2decodedBitFlips", 11) +
           mismatch("FS2decodedBitFlips(4120)", "11 elements; (11*4)", "48")},
      {MSP().add(4120, countingUp(10)),
       "10" + numbered("FS2decodedBitFlips", 10) +
           mismatch("FS2decodedBitFlips(4120)", "11 elements; (11*4)", "40")},
      {MSP().addHeader(16384, 13).addBytes(13, 1).add(4096, {2}),
       "2 fw_version_identifier=72340172838076673 passWithTmodeHard=2" +
           mismatch("fw_version_identifier(16384)", "1 elements; (1*8)", "13")},
      {MSP().addHeader(4096, 3).addBytes(3, 1).add(4097, {2}),
       "1 passWithTmodeFS1_2b=2" + mismatch("passWithTmodeHard(4096)", "1 elements; (1*4)", "3")},
      {MSP().add(12303, {1}),
       "1 readStage201=1" + mismatch("readStage201(12303)", "4 elements; (4*8)", "8")},
      {MSP().add(12303, {1, 2, 3, 0x400000000}),
       "4 readStage2010=1 readStage2011=2 readStage2012=3 readStage2013=17179869184"},
      {MSP().add(4096, {7}).addHeader(0x2FFE, 12).addBytes(12).add(8194, {8}),  // a filler
       "2 passWithTmodeHard=7 num_zq_failures=8"},
      {MSP().add(4096, {7}).addHeader(0x2FFE, 9).add(8194, {8}), "1 passWithTmodeHard=7"},
      {MSP().addHeader(0x2FFF, 0).add(4096, {7}).addHeader(0x2FFF, 1).add(4096, {8}),
       "1 passWithTmodeHard=7"},
      {MSP().add(8212, countingUp(4)).add(8220, countingUp(7)),
       "11" + numbered("open_blocks_hist", 4) + numbered("open_blocks_hist", 7)},
      {MSP().add(4180, {1}).add(20480, {1}).add(0, {1}).add(0xFFFF, {1}).add(4096, {7}),
       "1 passWithTmodeHard=7"},
      {MSP().add(4096, {7}).addHeader(8194, 4).addBytes(3), "1 passWithTmodeHard=7"}};
  for (const auto& [buffer, expected] : cases) {
    EXPECT_EQ(textOf(mspOutcome, buffer), expected);
  }
}

}  // namespace
}  // namespace vesprun
