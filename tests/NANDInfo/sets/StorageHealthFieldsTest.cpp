#include "NANDInfo/sets/StorageHealthFields.h"

#include "NANDInfo/sets/FilteredDict.h"
#include "buffers/DeviceBuffers.h"
#include "platform/host/documents/JsonForm.h"
#include "support/ControllerTest.h"
#include "vesprun/vesprun.hpp"

namespace vesprun {
namespace {

const std::string kSnapshot = R"(, "kernel": {"snapshot": "snapshot.bin"})";
const std::string kDisk =
    R"("HLT_OR_AmountDataAvailable_MB":15258,"HLT_OR_Diskfullness_BP":7500,"HLT_OR_Capacity_GB":64,)"
    R"("HLT_Capacity_GB":64,"HLT_Diskfullness_BP":7500,"HLT_UserCapacity_MB":61035,)";
const std::string kNoRefreshes = R"("HLT_numBootBlockRefreshes_max":0})";

class StorageHealthFieldsTest : public ControllerTest {};

TEST_F(StorageHealthFieldsTest, FreezerFigureIsTheSwapOutThreadsFourthCounter) {
  using Snapshot = SnapshotBuilder;
  Bytes counters(40, 0xFF);
  counters[24] = 0xFE;
  const std::pair<Bytes, std::string> cases[] = {
      {{}, ""},
      {Snapshot().thread(1, "idle", 7).bytes, ""},
      {Snapshot().thread(1, "VM_swapout", 7).bytes, "7"},
      {Snapshot().begin(1).name("VM_swapout", 64).item(2305, counters).bytes,
       "18446744073709551614"},
      {Snapshot().begin(1).name("VM_swapout").end(1).bytes, "0"},
      {Snapshot().begin(1).name("VM_swapout").item(2305, Bytes(31, 9)).end(1).bytes, "0"},
  };
  start("", kSnapshot);
  for (const auto& [snapshot, written] : cases) {
    device().write("snapshot.bin", snapshot);
    const std::string text = R"({"HLT_VMFreezer_bytesWritten":)" + written +
                             R"(,"com.quill.NANDInfo.VMFreezer.NumPhysicalWrites":)" + written +
                             '}';
    EXPECT_EQ(jsonText(CopyVMFreezerNANDInfo()), written.empty() ? "{}" : text);
  }
  start("");
  EXPECT_EQ(CopyVMFreezerNANDInfo(), PropertyDict());
}

TEST_F(StorageHealthFieldsTest, DeviceTellsWithoutFTLFields) {
  HostPlatform& platform =
      start("", kVolume + kSnapshot + R"(, "purgeable": {"RECLAIMER_TOTAL_AVAILABLE": 5})");
  device().write("snapshot.bin", SnapshotBuilder().thread(1, "VM_swapout", 7).bytes);
  const std::pair<std::optional<PropertyValue>, char> modes[] = {
      {std::nullopt, '0'}, {true, '1'}, {false, '0'}, {"yes", '0'}};
  for (const auto& [preference, mode] : modes) {
    platform.preferences().LGSPreferencesSetValue("StoreDemoMode", preference,
                                                  "com.quill.demo-settings");
    EXPECT_EQ(jsonText(gatherORUFTLOtherData(nullptr)),
              R"({"HLT_Reclaimer_totalPurgeable":5,"HLT_VMFreezer_bytesWritten":7,)"
              R"("com.quill.NANDInfo.VMFreezer.NumPhysicalWrites":7,)" +
                  kDisk + R"("HLT_storeDemoMode":)" + mode + '}');
  }
  EXPECT_EQ(GetAPIErrorMessage(), "gatherORUFTLOtherData: ftlDict is NULL");
}

TEST_F(StorageHealthFieldsTest, FieldsOfTheFTL) {
  using Entry = std::pair<PropertyDict, std::string>;
  const auto weeks = [](std::uint64_t formatTime, const std::string& expected) {
    return Entry({{"utilFormatTime", formatTime}},
                 R"("HLT_formatWeeksSince2000":)" + expected + ',' + kNoRefreshes);
  };
  const auto size = [](std::uint64_t user, std::uint64_t start, const std::string& expected) {
    return Entry({{"userPartitionStart", user}, {"intermediatePartitionStart", start}},
                 R"("HLT_intermediatePartitionSize":)" + expected + ',' + kNoRefreshes);
  };
  PropertyDict failures{{"mspBootBlockProgFails_5", std::uint64_t{0xFFFF'FFFF}}};
  for (std::uint64_t block = 0; block < 40; ++block) {
    failures.set("mspBootBlockReadFails_" + std::to_string(block), block + 1);
  }
  /// `main` and `backup` are the failures to read and to program.
  const auto sums = [&](std::uint64_t blocksPerMSP, const std::array<std::string, 2>& main,
                        const std::array<std::string, 2>& backup) {
    Entry entry(failures, R"("HLT_numBootBlockRefreshes_max":0)");
    entry.first.set("mspBootBlockCountPerMsp", blocksPerMSP);
    for (const auto& [part, sum] : {std::pair("main", main), std::pair("backup", backup)}) {
      entry.second += R"(,"HLT_mspBootBlockReadFails_)" + std::string(part) + R"(":)" + sum[0] +
                      R"(,"HLT_mspBootBlockProgFails_)" + part + R"(":)" + sum[1] +
                      R"(,"HLT_mspBootBlockEraseFails_)" + part + R"(":0)";
    }
    entry.second += '}';
    return entry;
  };
  const Entry cases[] = {
      {{{"userPartitionStart", 9}}, kNoRefreshes},
      {{{"powerOnSeconds", 5},
        {"powerOnHours", 4},
        {"hostWrites", 3},
        {"averageTLCPECycles", 2},
        {"averageSLCPECycles", 1}},
       R"("HLT_averageSLCPECycles":1,"HLT_averageTLCPECycles":2,"HLT_hostWrites":3,)"
       R"("HLT_powerOnHours":4,"HLT_powerOnSeconds":5,)" +
           kNoRefreshes},
      size(192, 64, "128"),
      size(1, 3, "18446744073709551614"),
      size(0x1'0000'0005, 0xFFFF'FFFF, "6"),
      size(0x7FFF'FFFF, 0x8000'0000, "4294967295"),
      weeks(946'684'800 + 604'799, "0"),
      weeks(946'684'800 + 604'800, "1"),
      weeks(0xFFFF'FFFF, "5536"),
      weeks(0x1'0000'0000, "0"),
      {{{"numBootBlockRefreshSuccess_3", 5},
        {"numBootBlockRefreshFail_3", 4},
        {"numBootBlockRefreshSuccess_7", 6},
        {"numBootBlockRefreshFail_8", 100}},
       R"("HLT_numBootBlockRefreshes_max":9})"},
      {failures, kNoRefreshes},
      sums(4, {"120", "0"}, {"408", "18446744073709551615"}),
      sums(0, {"8", "0"}, {"72", "0"}),
      sums(1, {"36", "18446744073709551615"}, {"156", "18446744073709551613"}),
      sums(std::uint64_t{1} << 63, {"4", "0"}, {"36", "0"}),
  };
  start("", kVolume);
  for (const auto& [ftl, expected] : cases) {
    const PropertyDict sources = CreateFilteredDict(ftl, &kSourcesOfOtherData);
    EXPECT_EQ(jsonText(gatherORUFTLOtherData(&sources)),
              '{' + kDisk + R"("HLT_storeDemoMode":0,)" + expected);
  }
}

}  // namespace
}  // namespace vesprun
