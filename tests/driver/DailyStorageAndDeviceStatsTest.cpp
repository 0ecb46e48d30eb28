#include "driver/DailyStorageAndDeviceStats.h"

#include "support/ControllerTest.h"
#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

constexpr const char* kTotal = "com.quill.homeshell.DiskUsageUserTotalBlocks";
constexpr const char* kFree = "com.quill.homeshell.DiskUsageUserBlocksFree";

class DailyStorageAndDeviceStatsTest : public ControllerTest {};

TEST_F(DailyStorageAndDeviceStatsTest, GoesOnAfterEachFailure) {
  start("", R"(, "properties": {"DiskUsage": null}, "channels": [{"name": "c", "value": 3}],
                 "kernel": {"snapshot": "none", "variables": {"kern.bootsessionuuid": "0A"}})");
  device().write("kernel/ecc/1.bin", std::string(72, '\0'));
  EXPECT_NE(errorsOf(LogDailyStorageAndDeviceStats), "");
  EXPECT_EQ(todaysScalars(device()),
            (Scalars{{kTotal, -1}, {kFree, -1}, {"com.quill.tapline.c", 3}}));
  EXPECT_THAT(device().log(),
              testing::Contains(testing::StartsWith("default: error reading nand info, error ")));
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
