#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/parsers/ORUStatsContext.h"
#include "support/ControllerTest.h"

namespace vesprun {
namespace {

const std::string kPrefix = "com.quill.NANDInfo.";

class NANDInfoDictTest : public ControllerTest {
 protected:
  NANDInfoDictTest() { start(""); }

  /// The legacy NAND info of these fields, and of nothing else.
  static PropertyDict infoOf(
      std::initializer_list<std::pair<std::string_view, std::uint64_t>> fields) {
    ORUStatsContext context;
    for (const auto& [name, value] : fields) {
      context.fields.append(name, value);
    }
    return CreateNANDInfoDict(context, true);
  }
  static const Number* figure(const PropertyDict& info, std::string_view suffix) {
    const PropertyValue* value = info.find(kPrefix + std::string(suffix));
    return value != nullptr ? value->number() : nullptr;
  }
};

TEST_F(NANDInfoDictTest, SummaryInOrderWithItsWidths) {
  ORUStatsContext context;
  context.exportVersion = 0xFFFFFFFF;
  context.driverVersion = -1;
  context.numVirtualBlocks = 1;
  context.pagesPerVirtualBlock = 2;
  context.bytesPerPage = 3;
  context.hostReads = 0xFFFF'FFFF'FFFF'FFFF;
  context.hostWrites = 5;
  context.numFreeVirtualBlocks = 6;
  context.wearLevMoves = 7;
  context.nandReads = 8;
  context.nandWrites = 9;
  context.bandErases = 10;
  context.IND_pool_free = 11;
  context.IND_pool_count = 12;
  context.numSleepOps = 13;
  context.maxHighEnduranceBlockErases = 14;
  context.blocksPerVirtualBlock = 15;
  context.readCountHisto = {16, 17, 18, 19, 20};
  std::string text;
  for (const auto& [key, value] : CreateNANDInfoDict(context, false)) {
    const Number& number = *value.number();
    text += key.substr(kPrefix.size()) + ' ';
    switch (number.kind()) {
      case NumberKind::Int32:
        text += "i32 " + std::to_string(number.asInt64());
        break;
      case NumberKind::UInt32:
        text += "u32 " + std::to_string(number.asUInt64());
        break;
      default:
        EXPECT_EQ(number.kind(), NumberKind::UInt64) << key;
        text += std::to_string(number.asUInt64());
    }
    text += '\n';
  }
  EXPECT_EQ(text,
            "ExportVersion u32 4294967295\nDriverVersion i32 -1\nDemoMode 0\n"
            "NumVirtualBlocks u32 1\nPagesPerVirtualBlock u32 2\nBytesPerPage u32 3\n"
            "NumLogicalReads 18446744073709551615\nNumLogicalWrites 5\nNumFreeVirtualBlocks 6\n"
            "NumWearLevelOps 7\nNumPhysicalReads 8\nNumPhysicalWrites 9\nNumPhysicalErases 10\n"
            "NodesFree 11\nNodesTotal 12\nformatDaysSince2000 0\nNumSleepOps 13\n"
            "HighEnduranceBlockEraseCount 14\nBlocksPerVirtualBlock u32 15\n"
            "ReadsBeforeErasure0 16\nReadsBeforeErasure50000 17\nReadsBeforeErasure100000 18\n"
            "ReadsBeforeErasure150000 19\nReadsBeforeErasure200000 20\n"
            "NumMaintenanceRequests 0\nMaintenanceRequestsFailedRead 0\n"
            "MaintenanceRequestsFailedProg 0\nMaintenanceRequestsFailedErase 0\n");
}

TEST_F(NANDInfoDictTest, FormatTimeInWeeks) {
  constexpr std::uint64_t kStart = 946684800;
  const std::pair<std::uint64_t, std::uint64_t> cases[] = {
      {0, 0},
      {kStart - 1, 0},
      {kStart, 0},
      {kStart + 604799, 0},
      {kStart + 604800, 1},
      {0xFFFF'FFFF'FFFF'FFFF, (0xFFFF'FFFF'FFFF'FFFF - kStart) / 604800}};
  for (const auto& [time, weeks] : cases) {
    ORUStatsContext context;
    context.utilFormatTime = time;
    EXPECT_EQ(figure(CreateNANDInfoDict(context, true), "formatDaysSince2000")->asUInt64(), weeks);
  }
}

TEST_F(NANDInfoDictTest, DemoModeFromPreferences) {
  for (const auto& [value, demo] : std::initializer_list<std::pair<PropertyValue, std::uint64_t>>{
           {true, 1}, {false, 0}, {"true", 0}}) {
    platform().preferences().LGSPreferencesSetValue("StoreDemoMode", value,
                                                    "com.quill.demo-settings");
    const PropertyDict info = CreateNANDInfoDict(ORUStatsContext(), false);
    EXPECT_EQ(figure(info, "DemoMode")->asUInt64(), demo);
  }
}

TEST_F(NANDInfoDictTest, FieldsUnderTheirKeys) {
  const PropertyDict info = infoOf({{"numFlushes", 12345},
                                    {"bitflipAddr0", 0x1'0000'0001},
                                    {"maxMemChokeDuration", 0x7'0000'3039},  // low 32 bits: 12345
                                    {"memChokeDuration", 12345},
                                    {"numPfail", 1},
                                    {"numPfail", 2},
                                    {"maxMemLowDuration", 12345},
                                    {"hostWrites", 9}});
  EXPECT_EQ(figure(info, "NumFlushes")->asUInt64(), 12345u);
  EXPECT_EQ(figure(info, "BitFlipAddrE2E")->asUInt64(), 0x1'0000'0001u);
  EXPECT_EQ(figure(info, "maxMemChokeDuration")->asUInt64(), 12300u);
  EXPECT_EQ(figure(info, "maxMemExtremeDuration")->asUInt64(), 12300u);
  EXPECT_EQ(figure(info, "memChokeDuration")->asUInt64(), 12345u);
  EXPECT_EQ(figure(info, "numPfail")->asUInt64(), 2u);
  EXPECT_EQ(figure(info, "hostWrites"), nullptr);
  EXPECT_EQ(info.size(), infoOf({}).size() + 6);
}

TEST_F(NANDInfoDictTest, PartitionSizeNeedsBothStarts) {
  const std::string size = "IntermediatePartitionSize";
  EXPECT_EQ(figure(infoOf({{"userPartitionStart", 300}}), size), nullptr);
  EXPECT_EQ(figure(infoOf({{"intermediatePartitionStart", 100}}), size), nullptr);
  EXPECT_EQ(
      figure(infoOf({{"userPartitionStart", 0xFFFFFFFF}, {"intermediatePartitionStart", 100}}),
             size),
      nullptr);
  const auto sizeOf = [&](std::uint64_t user, std::uint64_t intermediate) {
    const PropertyDict info =
        infoOf({{"userPartitionStart", user}, {"intermediatePartitionStart", intermediate}});
    return figure(info, size)->asUInt64();
  };
  EXPECT_EQ(sizeOf(300, 100), 200u);
  EXPECT_EQ(sizeOf(1, 3), 0xFFFF'FFFF'FFFF'FFFEu);
}

TEST_F(NANDInfoDictTest, MaintenanceIsSummedAndCounted) {
  const PropertyDict info = infoOf({{"numBootBlockRefreshSuccess0", 5},
                                    {"numBootBlockRefreshFail0", 7},
                                    {"numBootBlockRefreshSuccess1", 100},
                                    {"mspBootBlockReadFail0", 9},
                                    {"mspBootBlockReadFail1", 9},
                                    {"mspBootBlockReadFail2", 9},
                                    {"mspBootBlockReadFail3", 9},
                                    {"mspBootBlockProgFail0", 1},
                                    {"mspBootBlockProgFail1", 0},
                                    {"mspBootBlockProgFail2", 1},
                                    {"mspBootBlockEraseFail2", 1}});
  EXPECT_EQ(figure(info, "NumMaintenanceRequests")->asUInt64(), 12u);
  EXPECT_EQ(figure(info, "MaintenanceRequestsFailedRead")->asUInt64(), 3u);
  EXPECT_EQ(figure(info, "MaintenanceRequestsFailedProg")->asUInt64(), 2u);
  EXPECT_EQ(figure(info, "MaintenanceRequestsFailedErase")->asUInt64(), 1u);
}

}  // namespace
}  // namespace vesprun
