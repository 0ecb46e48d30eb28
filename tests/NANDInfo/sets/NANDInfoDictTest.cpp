#include "NANDInfo/parsers/ORUStatsContext.h"
#include "NANDInfo/sets/NANDInfoDict.h"
#include "common/TextForm.h"
#include "support/ControllerTest.h"

namespace vesprun {
namespace {

const std::string kPrefix = "com.quill.NANDInfo.";

class NANDInfoDictTest : public ControllerTest {
 protected:
  NANDInfoDictTest() { start(""); }

  /// The legacy NAND info of these fields, and of nothing else.
  static PropertyDict infoOf(
      const std::vector<std::pair<std::string_view, std::uint64_t>>& fields) {
    ORUStatsContext context;
    for (const auto& [name, value] : fields) {
      context.fields.append(name, "", value);
    }
    return CreateNANDInfoDict(context, true);
  }
  /// The text of a figure.
  static std::string figure(const PropertyDict& info, std::string_view suffix) {
    const PropertyValue* value = info.find(kPrefix + std::string(suffix));
    return value != nullptr ? textForm(*value) : "none";
  }
};

TEST_F(NANDInfoDictTest, SummaryInOrderWithItsWidths) {
  ORUStatsContext context;
  context.exportVersion = 0xFFFFFFFF;
  context.driverVersion = -1;
  context.numVirtualBlocks = 1;
  context.pagesPerVirtualBlock = 2;
  context.bytesPerPage = 3;
  std::uint64_t next = 4;
  for (std::uint64_t* each :
       {&context.hostReads, &context.hostWrites, &context.numFreeVirtualBlocks,
        &context.wearLevMoves, &context.nandReads, &context.nandWrites, &context.bandErases,
        &context.IND_pool_free, &context.IND_pool_count, &context.numSleepOps,
        &context.maxHighEnduranceBlockErases}) {
    *each = next++;
  }
  context.hostReads = 0xFFFF'FFFF'FFFF'FFFF;
  context.blocksPerVirtualBlock = 15;
  context.utilFormatTime = ~std::uint64_t{0};
  context.readCountHisto = {16, 17, 18, 19, 20};
  platform().preferences().LGSPreferencesSetValue("StoreDemoMode", true, "com.quill.demo-settings");
  std::string text;
  for (const auto& [key, value] : CreateNANDInfoDict(context, false)) {
    const Number& number = *value.number();
    const char* width = number.kind() == NumberKind::Int32    ? " i32 "
                        : number.kind() == NumberKind::UInt32 ? " u32 "
                        : number.kind() == NumberKind::UInt64 ? " "
                                                              : " another kind ";
    text += key.substr(kPrefix.size()) + width + textForm(value) + '\n';
  }
  EXPECT_EQ(text,
            "ExportVersion u32 4294967295\nDriverVersion i32 -1\nDemoMode 1\n"
            "NumVirtualBlocks u32 1\nPagesPerVirtualBlock u32 2\nBytesPerPage u32 3\n"
            "NumLogicalReads 18446744073709551615\nNumLogicalWrites 5\nNumFreeVirtualBlocks 6\n"
            "NumWearLevelOps 7\nNumPhysicalReads 8\nNumPhysicalWrites 9\nNumPhysicalErases 10\n"
            "NodesFree 11\nNodesTotal 12\nformatDaysSince2000 30500568903377\nNumSleepOps 13\n"
            "HighEnduranceBlockEraseCount 14\nBlocksPerVirtualBlock u32 15\n"
            "ReadsBeforeErasure0 16\nReadsBeforeErasure50000 17\nReadsBeforeErasure100000 18\n"
            "ReadsBeforeErasure150000 19\nReadsBeforeErasure200000 20\n"
            "NumMaintenanceRequests 0\nMaintenanceRequestsFailedRead 0\n"
            "MaintenanceRequestsFailedProg 0\nMaintenanceRequestsFailedErase 0\n");
}

TEST_F(NANDInfoDictTest, PartitionSizeNeedsBothStarts) {
  const std::string user = "userPartitionStart";
  const std::string intermediate = "intermediatePartitionStart";
  const std::string size = "IntermediatePartitionSize";
  EXPECT_EQ(figure(infoOf({{user, 300}}), size), "none");
  EXPECT_EQ(figure(infoOf({{intermediate, 100}}), size), "none");
  EXPECT_EQ(figure(infoOf({{user, 0xFFFFFFFF}, {intermediate, 100}}), size), "none");
  EXPECT_EQ(figure(infoOf({{user, 300}, {intermediate, 100}}), size), "200");
  EXPECT_EQ(figure(infoOf({{user, 1}, {intermediate, 3}}), size), "18446744073709551614");
}

}  // namespace
}  // namespace vesprun
