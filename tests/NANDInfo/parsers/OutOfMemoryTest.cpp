#include <gmock/gmock.h>
#include <cstdint>

#include "FieldsOf.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/KernelSnapshot.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "NANDInfo/structuredlog/TelemetryList.h"
#include "buffers/DeviceBuffers.h"
#include "common/ProcessState.h"
#include "support/ScarceMemory.h"

namespace vesprun {
namespace {

/// What `parse` does while no allocation is larger than `most`.
template <typename Parse>
auto whileScarce(std::size_t most, const Parse& parse) {
  ProcessState::startAfresh();
  largestAllocation = most;
  const auto result = parse();
  largestAllocation = SIZE_MAX;
  return result;
}

// Names are kept in one text, values in one list: at 1,000 bytes, some 60 fields find room.
constexpr std::size_t kScarce = 1000;

TEST(OutOfMemory, LeavesFieldsOutOfTheBaseStatistics) {
  const Bytes buffer =
      StatisticsBufferBuilder().add(90, std::vector<std::uint64_t>(160, 1)).add(4, {5}).bytes();
  ORUStatsContext ctx;
  EXPECT_TRUE(whileScarce(kScarce, [&] { return ORUParseBufferToCxt(ctx, buffer); }));
  const std::size_t kept = ctx.fields.size();
  EXPECT_GT(kept, 10U);
  EXPECT_LT(kept, 160U);
  EXPECT_EQ(fieldsOf(ctx.fields).back().first, "qosPerCmdQ" + std::to_string(kept - 1));
  EXPECT_EQ(ctx.hostWrites, 5U);
  EXPECT_TRUE(AddSingleValueToGenericContext(ctx.fields, "a", "b", 1));
  EXPECT_EQ(fieldsOf(ctx.fields).back(), Fields::value_type("ab", 1));
}

TEST(OutOfMemory, IsRecordedByTheOtherParsers) {
  const std::vector<std::uint64_t> words(160, 1);
  const Bytes ftl = StatisticsBufferBuilder().add(4, {5}).add(90, words).add(7, {1}).bytes();
  const Bytes msp = MSPBufferBuilder()
                        .add(4096, {5})
                        .add(4232, std::vector<std::uint64_t>(64))
                        .add(4097, {1})
                        .bytes();
  const Bytes single = StatisticsBufferBuilder().add(4, {5}).add(7, {6}).bytes();
  const std::tuple<std::uint32_t (*)(GenericParserCxt&, std::span<const std::uint8_t>),
                   const Bytes*, std::size_t, std::uint32_t, const char*>
      cases[] = {
          {ORUFTLParseBufferToCxt, &ftl, kScarce, 1,
           "ORUFTLParseBufferToCxt: qosPerCmdQ(90): Cannot add 160 elements to context"},
          {ORUFTLParseBufferToCxt, &single, 0, 2,
           "ORUFTLParseBufferToCxt: hostWrites(4) cannot add 1 element to context"},
          {ORUFTLParseStatKeyBufferToCxt, &ftl, kScarce, 1,
           "ORUFTLParseBufferToCxt 90: Cannot add 160 elements to context"},
          {ORUMSPParseBufferToCxt, &msp, kScarce, 1,
           "ORUMSPParseBufferToCxt: readStageNumOfFails108(4232): Error adding 64 elements to "
           "context"},
          {ORUMSPParseBufferToCxt, &msp, 0, 0,
           "ORUMSPParseBufferToCxt: passWithTmodeHard(4096): Error adding 1 elements to context"}};
  for (const auto& [parse, buffer, most, taken, error] : cases) {
    GenericParserCxt ctx;
    EXPECT_EQ(
        whileScarce(most, [&, parse = parse, buffer = buffer] { return parse(ctx, *buffer); }),
        taken)
        << error;
    EXPECT_EQ(GetAPIErrorMessage(), error);
  }
}

TEST(OutOfMemory, EndsTheSearchOfASnapshotAndATelemetryList) {
  SnapshotBuilder deep;
  for (std::uint64_t id = 0; id < 100; ++id) {
    deep.begin(id);
  }
  deep.thread(100, "VM_swapout", 7);
  std::optional<std::span<const std::uint8_t>> statistics;
  const auto search = [&] {
    return getIOStatsWithThreadnameFromSnapData(deep.bytes, "VM_swapout", statistics);
  };
  EXPECT_FALSE(whileScarce(kScarce, search));
  EXPECT_TRUE(whileScarce(SIZE_MAX, search));

  testing::internal::CaptureStderr();
  EXPECT_FALSE(whileScarce(700, [] { return LogNANDTelemetryList({}, nullptr, ""); }));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "ERROR: Could not malloc 708 bytes\n");
}

}  // namespace
}  // namespace vesprun
