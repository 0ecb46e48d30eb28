#include "driver/DailyStorageAndDeviceStats.h"

#include "buffers/DeviceBuffers.h"
#include "support/ControllerTest.h"
#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

using testing::Contains, testing::HasSubstr, testing::Pair;

constexpr const char* kTotal = "com.quill.homeshell.DiskUsageUserTotalBlocks";
constexpr const char* kFree = "com.quill.homeshell.DiskUsageUserBlocksFree";
constexpr const char* kFreezerWrites = "com.quill.NANDInfo.VMFreezer.NumPhysicalWrites";
constexpr const char* kExportVersion = "com.quill.NANDInfo.ExportVersion";

/// A kernel whose session begins like this, and whose snapshot may be there.
std::string session(const std::string& identifier) {
  return R"(, "kernel": {"snapshot": "snapshot.bin", "variables": {"kern.bootsessionuuid": ")" +
         identifier + "\"}}";
}

class DailyStorageAndDeviceStatsTest : public ControllerTest {};

TEST_F(DailyStorageAndDeviceStatsTest, RecordsEverythingOfTheDay) {
  start(controller("QuillQNS3NVMeController", kStatisticsAnswer),
        session("0A") + R"(, "properties": {"DiskUsage": {"TotalDiskCapacity": 64000000000,
                               "TotalDataAvailable": -1}},
             "purgeable": {"RECLAIMER_TOTAL_AVAILABLE": 5},
             "usage": {"records": [{"procName": "p", "since": {"date": "2024-03-05T00:00:00Z"},
                                    "wifiInBytes": 2048}]},
             "channels": [{"name": "c", "value": 3}])");
  device().write("kernel/ecc/1.bin", std::string(72, '\0'));
  device().write("snapshot.bin", SnapshotBuilder().thread(1, "VM_swapout", 7).bytes);
  errorsOf(LogDailyStorageAndDeviceStats);
  const Scalars scalars = todaysScalars(device());
  for (const auto& [key, value] : Scalars{{kTotal, 61035},
                                          {kFree, -1},
                                          {kExportVersion, 17},
                                          {"com.quill.NANDInfo.DemoMode", 0},
                                          {"com.quill.NANDInfo.Reclaimer.TotalPurgeableBytes", 5},
                                          {"HLT_VMFreezer_bytesWritten", 7},
                                          {kFreezerWrites, 7},
                                          {"datausage.wifiInKB.com.quill.p", 2},
                                          {"com.quill.tapline.c", 3}}) {
    EXPECT_THAT(scalars, Contains(Pair(key, value)));
  }
  EXPECT_THAT(device().read("outbox/records.jsonl"),
              HasSubstr(R"("type":172,"record":{"id":0,"count":0}})"));
}

TEST_F(DailyStorageAndDeviceStatsTest, GoesOnAfterEachFailure) {
  start("", session("0A") + R"(, "properties": {"DiskUsage": null},
                               "channels": [{"name": "c", "value": 3}])");
  device().write("kernel/ecc/1.bin", std::string(72, '\0'));
  EXPECT_NE(errorsOf(LogDailyStorageAndDeviceStats), "");
  EXPECT_EQ(todaysScalars(device()),
            (Scalars{{kTotal, -1}, {kFree, -1}, {"com.quill.tapline.c", 3}}));
  EXPECT_THAT(device().log(),
              Contains(testing::StartsWith("default: error reading nand info, error ")));
  EXPECT_EQ(device().lines("records.jsonl").size(), 1U);
}

TEST(NANDInfoScalars, WritesNumbersAndBooleansUnlessThereIsAnError) {
  TestDevice device;
  PropertyDict info{{"number", 7U},
                    {"wide", ~std::uint64_t{0}},
                    {"fraction", -2.9},
                    {"yes", true},
                    {"no", false},
                    {"text", "8"},
                    {"data", Bytes{1}},
                    {"date", Date{1}},
                    {"dict", PropertyDict()},
                    {"array", PropertyArray{1}}};
  SetNANDInfoScalars(info);
  const Scalars written{{"number", 7}, {"wide", -1}, {"fraction", -2}, {"yes", 1}, {"no", 0}};
  EXPECT_EQ(todaysScalars(device), written);
  info.set("number", 8);
  info.set("com.quill.NANDInfo.Error", -1);
  SetNANDInfoScalars(info);
  info.set("com.quill.NANDInfo.ErrorMessage", "not found");
  SetNANDInfoScalars(info);
  EXPECT_EQ(todaysScalars(device), written);
  EXPECT_THAT(
      device.log(),
      testing::ElementsAre("default: error reading nand info, error -1 with message (null)",
                           "default: error reading nand info, error -1 with message not found"));
}

}  // namespace
}  // namespace vesprun
