#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <numeric>
#include <random>

#include "FieldsOf.h"
#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "platform/host/StatisticsBufferBuilder.h"

namespace vesprun {
namespace {

using Words = std::vector<std::uint64_t>;

Words countingUp(std::size_t count, std::uint64_t first = 0) {
  Words words(count);
  std::iota(words.begin(), words.end(), first);
  return words;
}

Fields numbered(const std::string& name, std::size_t count, std::uint64_t first = 0) {
  Fields fields;
  for (std::size_t i = 0; i < count; ++i) {
    fields.emplace_back(name + std::to_string(i), first + i);
  }
  return fields;
}

/// The first `size` bytes of a buffer at an odd address and with nothing behind them, so that a
/// read outside is seen.
class ExactCopy {
 public:
  ExactCopy(const Bytes& bytes, std::size_t size)
      : _bytes(new std::uint8_t[size + 1]), _size(size) {
    std::copy_n(bytes.begin(), size, _bytes.get() + 1);
  }
  std::span<const std::uint8_t> span() const { return {_bytes.get() + 1, _size}; }

 private:
  std::unique_ptr<std::uint8_t[]> _bytes;
  std::size_t _size;
};

struct Outcome {
  std::uint32_t result = 0;
  Fields fields;
  std::string error;
  friend bool operator==(const Outcome&, const Outcome&) = default;
};

template <auto parse>
Outcome outcomeOf(std::span<const std::uint8_t> buffer) {
  forgetAPIErrorMessage();
  GenericParserCxt ctx;
  const std::uint32_t result = parse(ctx, buffer);
  return {result, fieldsOf(ctx), GetAPIErrorMessage()};
}
constexpr auto ftl = outcomeOf<ORUFTLParseBufferToCxt>;
constexpr auto ftlStatKey = outcomeOf<ORUFTLParseStatKeyBufferToCxt>;
constexpr auto msp = outcomeOf<ORUMSPParseBufferToCxt>;

Outcome base(std::span<const std::uint8_t> buffer) {
  forgetAPIErrorMessage();
  ORUStatsContext ctx;
  const bool result = ORUParseBufferToCxt(ctx, buffer);
  return {result, fieldsOf(ctx.fields), GetAPIErrorMessage()};
}

struct Case {
  const char* what;
  Bytes buffer;
  Outcome expected;
};

void check(Outcome (*parse)(std::span<const std::uint8_t>), std::initializer_list<Case> cases) {
  for (const Case& each : cases) {
    const Outcome outcome = parse(ExactCopy(each.buffer, each.buffer.size()).span());
    EXPECT_EQ(outcome.result, each.expected.result) << each.what;
    EXPECT_EQ(outcome.fields, each.expected.fields) << each.what;
    EXPECT_EQ(outcome.error, each.expected.error) << each.what;
  }
}

using Statistics = StatisticsBufferBuilder;

TEST(BaseParser, walksRecords) {
  Bytes trailing = Statistics().add(4, {5}).bytes();
  trailing.insert(trailing.end(), {1, 2, 3, 4});
  Fields histogram = numbered("bandsPerHostFlow", 3, 10);
  histogram[2].second = 18;  // the next record's header, and its payload behind the end
  check(base,
        {
            {"empty", {}, {0, {}, "NA"}},
            {"no word", Bytes(7), {0, {}, "NA"}},
            {"trailing bytes", trailing, {1, {{"hostWrites", 5}}, "NA"}},
            {"an unknown id", Statistics().add(900, {}).bytes(), {1, {}, "NA"}},
            {"ids without an entry",
             Statistics().add(0, {1}).add(21, {1, 2}).add(829, {}).add(0x30000000, {9}).bytes(),
             {1, {}, "NA"}},
            {"an invalid id",
             Statistics().add(4, {5}).add(0x30000001, {}).add(7, {1}).bytes(),
             {0, {{"hostWrites", 5}}, "NA"}},
            {"a word too few",
             Statistics().add(7, {6}).addHeader(4, 2).addWord(1).bytes(),
             {0, {{"hostReads", 6}}, "NA"}},
            {"more words than elements",
             Statistics().add(90, countingUp(200)).add(4, {1, 2, 3}).bytes(),
             {1,
              [] {
                Fields fields = numbered("qosPerCmdQ", 160);
                fields.emplace_back("hostWrites", 1);
                return fields;
              }(),
              "NA"}},
            {"the same twice",
             Statistics().add(1, {1}).add(1, {2}).bytes(),
             {1, {{"version", 1}, {"version", 2}}, "NA"}},
            {"values from the next record",
             Statistics().add(4, {}).add(900, {}).bytes(),
             {1, {{"hostWrites", 900}}, "NA"}},
            {"elements from the next record, and none behind the end",
             Statistics().add(113, {10, 11}).addHeader(18, 0).bytes(),
             {1, histogram, "NA"}},
            {"one element within the buffer",
             Statistics().add(113, {10}).bytes(),
             {1, {{"bandsPerHostFlow0", 10}}, "NA"}},
            {"no element within the buffer", Statistics().add(113, {}).bytes(), {1, {}, "NA"}},
        });
}

TEST(BaseParser, fillsTheSummary) {
  Statistics buffer;
  const std::uint32_t ids[] = {53, 52, 51, 50, 49, 7, 4, 48, 17, 18, 19, 20, 12, 13, 56, 28, 45};
  for (const std::uint32_t id : ids) {
    buffer.add(id, {0x500000000U + id});
  }
  buffer.add(265, {1, 2, 3, 4, 5});
  ORUStatsContext ctx;
  ASSERT_TRUE(ORUParseBufferToCxt(ctx, buffer.bytes()));
  const std::uint64_t kept[] = {ctx.exportVersion,
                                ctx.numVirtualBlocks,
                                ctx.blocksPerVirtualBlock,
                                ctx.pagesPerVirtualBlock,
                                ctx.bytesPerPage,
                                ctx.hostReads,
                                ctx.hostWrites,
                                ctx.numFreeVirtualBlocks,
                                ctx.wearLevMoves,
                                ctx.nandWrites,
                                ctx.nandReads,
                                ctx.bandErases,
                                ctx.IND_pool_free,
                                ctx.IND_pool_count,
                                ctx.utilFormatTime,
                                ctx.numSleepOps,
                                ctx.maxHighEnduranceBlockErases};
  for (std::size_t i = 0; i < std::size(kept); ++i) {
    EXPECT_EQ(kept[i], ids[i] + (i < 5 ? 0U : 0x500000000U)) << ids[i];
  }
  EXPECT_THAT(ctx.readCountHisto, ::testing::ElementsAre(1, 2, 3, 4, 5));
  EXPECT_EQ(ctx.driverVersion, -1);
  EXPECT_EQ(ctx.fields.size(), std::size(ids) + 5);

  // A later parse adds; a failing one takes back the export version only.
  EXPECT_FALSE(ORUParseBufferToCxt(ctx, Bytes(7)));
  EXPECT_EQ(ctx.exportVersion, 53U);
  EXPECT_FALSE(ORUParseBufferToCxt(ctx, Statistics().add(4, {8}).addHeader(4, 1).bytes()));
  EXPECT_EQ(ctx.exportVersion, 0U);
  EXPECT_EQ(ctx.hostWrites, 8U);
  EXPECT_EQ(ctx.hostReads, 0x500000007U);
  EXPECT_EQ(ctx.fields.size(), std::size(ids) + 6);
  ORUReleaseContext(ctx);
  EXPECT_TRUE(ctx.fields.empty());
  EXPECT_EQ(ctx.driverVersion, 0);
  EXPECT_EQ(ctx.readCountHisto[4], 0U);
}

TEST(FTLParser, walksRecords) {
  const std::string tooMany = "ORUFTLParseBufferToCxt 900: Cannot add 65536 elements to context";
  const Bytes large = Statistics().add(11, {1}).add(900, Words(65'536)).add(11, {2}).bytes();
  check(
      ftl,
      {
          {"empty", {}, {0, {}, "NA"}},
          {"no payload", Statistics().add(11, {}).bytes(), {0, {}, "NA"}},
          {"no payload, whatever the id",
           Statistics().add(65535, {}).add(0xFFFFFFFF, {}).add(11, {3}).bytes(),
           {1, {{"uncleanBoots", 3}}, "NA"}},
          {"a single value with more words",
           Statistics().add(11, {7, 8, 9}).add(4, {1}).bytes(),
           {2, {{"uncleanBoots", 7}, {"hostWrites", 1}}, "NA"}},
          {"an array",
           Statistics().add(14, countingUp(10)).bytes(),
           {10, numbered("hostWriteLogHisto_", 10), "NA"}},
          {"a longer array, and the first error of two",
           Statistics().add(90, countingUp(200)).add(14, countingUp(2, 5)).bytes(),
           {162,
            [] {
              Fields fields = numbered("qosPerCmdQ_", 160);
              fields.insert(fields.end(), {{"hostWriteLogHisto_0", 5}, {"hostWriteLogHisto_1", 6}});
              return fields;
            }(),
            "ORUFTLParseBufferToCxt: qosPerCmdQ(90): (#160) cfg elements != (200) buffer "
            "elements"}},
          {"one element of an array",
           Statistics().add(90, {4}).bytes(),
           {1,
            {{"qosPerCmdQ_", 4}},
            "ORUFTLParseBufferToCxt: qosPerCmdQ(90): (#160) cfg elements != (1) buffer elements"}},
          {"unknown ids",
           Statistics().add(74, {1}).add(74, {1, 2, 3}).add(0x30000000, {5}).bytes(),
           {5,
            {{"Stat_74", 1},
             {"Stat_74_0", 1},
             {"Stat_74_1", 2},
             {"Stat_74_2", 3},
             {"Stat_805306368", 5}},
            "NA"}},
          {"an invalid id",
           Statistics().add(4, {1}).add(0x30000001, {2}).add(7, {3}).bytes(),
           {1, {{"hostWrites", 1}}, "NA"}},
          {"no id",
           Statistics().add(4, {1}).add(65535, {2}).add(7, {3}).bytes(),
           {1, {{"hostWrites", 1}}, "NA"}},
          {"a word too few",
           Statistics().add(4, {1}).addHeader(74, 2).addWord(1).bytes(),
           {1, {{"hostWrites", 1}}, "NA"}},
          {"an unknown array too large", large, {1, {{"uncleanBoots", 1}}, tooMany}},
      });
  check(ftlStatKey, {
                        {"known ids",
                         Statistics().add(11, {7}).add(14, countingUp(10)).bytes(),
                         {11,
                          [] {
                            Fields fields = numbered("Stat_14_", 10);
                            fields.insert(fields.begin(), {"Stat_11", 7});
                            return fields;
                          }(),
                          "NA"}},
                        {"an array too large", large, {1, {{"Stat_11", 1}}, tooMany}},
                        {"no id", Statistics().add(65535, {2}).add(7, {3}).bytes(), {0, {}, "NA"}},
                    });
}

TEST(MSPParser, walksRecords) {
  using MSP = MSPBufferBuilder;
  check(
      msp,
      {
          {"empty",
           {},
           {0, {}, "ORUMSPParseBufferToCxt: Passed in invalid buffer or empty buffer"}},
          {"an end marker", MSP().addHeader(0x2FFF, 4).bytes(), {0, {}, "NA"}},
          {"one value", MSP().add(4096, {7}).bytes(), {1, {{"passWithTmodeHard", 7}}, "NA"}},
          {"too few bytes for a header",
           MSP().add(4096, {7}).addBytes(3).bytes(),
           {1, {{"passWithTmodeHard", 7}}, "NA"}},
          {"an array too long",
           MSP().add(4120, countingUp(12)).bytes(),
           {11, numbered("FS2decodedBitFlips", 11),
            "ORUMSPParseBufferToCxt: FS2decodedBitFlips(4120): cfg 11 elements; (11*4) cfg bytes "
            "!= (48) buffer bytes"}},
          {"an array too short",
           MSP().add(4120, countingUp(10)).bytes(),
           {10, numbered("FS2decodedBitFlips", 10),
            "ORUMSPParseBufferToCxt: FS2decodedBitFlips(4120): cfg 11 elements; (11*4) cfg bytes "
            "!= (40) buffer bytes"}},
          {"a single value too long, of no whole number of elements",
           MSP().addHeader(16384, 13).addBytes(13, 1).add(4096, {2}).bytes(),
           {2,
            {{"fw_version_identifier", 0x0101010101010101}, {"passWithTmodeHard", 2}},
            "ORUMSPParseBufferToCxt: fw_version_identifier(16384): cfg 1 elements; (1*8) cfg bytes "
            "!= (13) buffer bytes"}},
          {"less than one element",
           MSP().addHeader(4096, 3).addBytes(3, 1).add(4097, {2}).bytes(),
           {1,
            {{"passWithTmodeFS1_2b", 2}},
            "ORUMSPParseBufferToCxt: passWithTmodeHard(4096): cfg 1 elements; (1*4) cfg bytes != "
            "(3) buffer bytes"}},
          {"one element of an array",
           MSP().add(12303, {1}).bytes(),
           {1,
            {{"readStage201", 1}},
            "ORUMSPParseBufferToCxt: readStage201(12303): cfg 4 elements; (4*8) cfg bytes != (8) "
            "buffer bytes"}},
          {"64-bit elements",
           MSP().add(12303, {1, 2, 3, 0x400000000}).bytes(),
           {4,
            {{"readStage2010", 1},
             {"readStage2011", 2},
             {"readStage2012", 3},
             {"readStage2013", 0x400000000}},
            "NA"}},
          {"a filler",
           MSP().add(4096, {7}).addHeader(0x2FFE, 12).addBytes(12).add(8194, {8}).bytes(),
           {2, {{"passWithTmodeHard", 7}, {"num_zq_failures", 8}}, "NA"}},
          {"a filler too long",
           MSP().add(4096, {7}).addHeader(0x2FFE, 9).add(8194, {8}).bytes(),
           {1, {{"passWithTmodeHard", 7}}, "NA"}},
          {"an end marker, without payload and with",
           MSP().addHeader(0x2FFF, 0).add(4096, {7}).addHeader(0x2FFF, 1).add(4096, {8}).bytes(),
           {1, {{"passWithTmodeHard", 7}}, "NA"}},
          {"two keys of one name",
           MSP().add(8212, countingUp(4)).add(8220, countingUp(7)).bytes(),
           {11,
            [] {
              Fields fields = numbered("open_blocks_hist", 4);
              for (Fields::value_type& field : numbered("open_blocks_hist", 7)) {
                fields.push_back(field);
              }
              return fields;
            }(),
            "NA"}},
          {"unknown keys",
           MSP().add(4180, {1}).add(20480, {1}).add(0, {1}).add(0xFFFF, {1}).add(4096, {7}).bytes(),
           {1, {{"passWithTmodeHard", 7}}, "NA"}},
          {"a record too long",
           MSP().add(4096, {7}).addHeader(8194, 4).addBytes(3).bytes(),
           {1, {{"passWithTmodeHard", 7}}, "NA"}},
      });
}

Bytes allStatistics() {
  Statistics buffer;
  for (const ORUStatKey& key : ORUStatKeyTable) {
    buffer.add(key.id, countingUp(key.count, key.id));
  }
  return buffer.bytes();
}

Bytes allMSPStatistics() {
  MSPBufferBuilder buffer;
  for (const ORUMSPKey& key : ORUMSPKeyTable) {
    buffer.add(key.key, countingUp(key.count, key.key));
  }
  return buffer.bytes();
}

TEST(StatisticsParsers, decodeEveryKnownStatistic) {
  const Outcome all = ftl(allStatistics());
  EXPECT_EQ(all.result, 540U + 1956U);
  EXPECT_EQ(all.error, "NA");
  EXPECT_EQ(base(allStatistics()).fields.size(), 540U + 1956U);
  EXPECT_EQ(base(allStatistics()).fields.back(), Fields::value_type("numDipFailures", 828));
  EXPECT_EQ(ftlStatKey(allStatistics()).result, 540U + 1956U);
  EXPECT_EQ(msp(allMSPStatistics()).result, 857U);
  EXPECT_EQ(msp(allMSPStatistics()).error, "NA");
}

/// What is decoded of a buffer's beginning is the beginning of what is decoded of the buffer; the
/// base parser may leave out the elements that the cut takes from an array.
TEST(StatisticsParsers, readNothingBehindACut) {
  const Bytes records = Statistics().add(4, {1}).add(14, countingUp(10)).add(900, {1, 2}).bytes();
  const Bytes elements = MSPBufferBuilder().add(4096, {1}).add(4121, {1, 2, 3, 4}).bytes();
  for (const auto& [parse, buffer] : {std::pair(&base, records), std::pair(ftl, records),
                                      std::pair(ftlStatKey, records), std::pair(msp, elements)}) {
    const Fields all = parse(buffer).fields;
    std::size_t before = 0;
    for (std::size_t size = 1; size <= buffer.size(); ++size) {
      const Fields some = parse(ExactCopy(buffer, size).span()).fields;
      ASSERT_LE(some.size(), all.size()) << size;
      EXPECT_TRUE(std::equal(some.begin(), some.end(), all.begin())) << size;
      EXPECT_GE(some.size(), before) << size;
      before = some.size();
    }
    EXPECT_EQ(before, all.size());
  }
}

TEST(StatisticsParsers, surviveMutations) {
  std::mt19937 random(20240305);
  const auto mutated = [&random](Bytes bytes) {
    for (unsigned change = random() % 8; change != 0; --change) {
      bytes[random() % bytes.size()] = static_cast<std::uint8_t>(random());
    }
    bytes.resize(bytes.size() - random() % 9);
    return bytes;
  };
  for (int round = 0; round < 50; ++round) {
    const Bytes records = mutated(allStatistics());
    const ExactCopy copy(records, records.size());
    for (const auto parse : {ftl, ftlStatKey}) {
      const Outcome outcome = parse(copy.span());
      EXPECT_EQ(outcome.result, outcome.fields.size()) << round;
    }
    EXPECT_LE(base(copy.span()).result, 1U) << round;
    const Bytes elements = mutated(allMSPStatistics());
    const Outcome outcome = msp(ExactCopy(elements, elements.size()).span());
    EXPECT_EQ(outcome.result, outcome.fields.size()) << round;
  }
}

}  // namespace
}  // namespace vesprun
