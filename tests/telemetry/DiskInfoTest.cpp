#include "telemetry/DiskInfo.h"

#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

struct VolumeCase {
  const char* volume;
  const char* usage;  ///< answer to "DiskUsage"
  std::int64_t available, fullness, capacity, size;
};

constexpr const char* kNull = "null";

TEST(DiskInfo, MeasuresTheVolumeOrAsksForDiskUsage) {
  const VolumeCase cases[] = {
      // Measured: capacity by decimal megabytes.
      {R"({"blockSize": 4096, "blocks": 15625000, "available": 3906250})", kNull, 15258, 7500, 64,
       61035},
      {R"({"blockSize": 1000, "blocks": 1500000000, "available": 0})", kNull, 0, 10000, 1536,
       1430511},
      {R"({"blockSize": 1000, "blocks": 65536000, "available": 32768000})", kNull, 31250, 5000, 128,
       62500},
      // As full and as small as is still believed.
      {R"({"blockSize": 4096, "blocks": 10000000, "available": 9999000})", kNull, 39058, 1, 64,
       39062},
      {R"({"blockSize": 1000, "blocks": 512000, "available": 0})", kNull, 0, 10000, 1, 488},
      {R"({"blockSize": 1000, "blocks": 1023000, "available": 0})", kNull, 0, 10000, 1, 975},
      // Nearly empty, without a size and too small for a gigabyte: not believed.
      {R"({"blockSize": 4096, "blocks": 10000000, "available": 9999001})",
       R"({"TotalDiskCapacity": 137438953472})", 0, 10000, 256, 131072},
      {R"({"blockSize": 4096, "blocks": 0, "available": 0})", kNull, 0, 0, 0, 0},
      {R"({"blockSize": 1000, "blocks": 511000, "available": 1})",
       R"({"AmountDataAvailable": 3145727})", 2, 0, 0, 0},
      // Asked: capacity by binary megabytes, two figures of what is available.
      {kNull,
       R"({"TotalDiskCapacity": 137438953472, "TotalDataAvailable": 34359738368,
           "AmountDataAvailable": 1048576000})",
       1000, 7500, 256, 131072},
      {kNull, R"({"TotalDiskCapacity": 1048576, "TotalDataAvailable": 2097152})", 0, -10000, 0, 1},
      {kNull, R"({"TotalDataAvailable": -1, "AmountDataAvailable": -1})", -1, 0, 0, 0},
      {kNull, kNull, 0, 0, 0, 0},
  };
  for (const VolumeCase& c : cases) {
    TestDevice device(deviceWith(std::string(R"("userVolume": )") + c.volume +
                                 R"(, "properties": {"DiskUsage": )" + c.usage + "}"));
    const PropertyDict info = GetDiskInfo();
    EXPECT_EQ(info, (PropertyDict{{"HLT_OR_AmountDataAvailable_MB", c.available},
                                  {"HLT_OR_Diskfullness_BP", c.fullness},
                                  {"HLT_OR_Capacity_GB", c.capacity},
                                  {"HLT_Capacity_GB", c.capacity},
                                  {"HLT_Diskfullness_BP", c.fullness},
                                  {"HLT_UserCapacity_MB", c.size}}))
        << c.volume << c.usage;
    for (const auto& [key, value] : info) {
      const NumberKind asked = key.ends_with("_GB") ? NumberKind::UInt32 : NumberKind::Int64;
      EXPECT_EQ(value.number()->kind(), &c - cases < 6 ? NumberKind::UInt64 : asked) << key;
    }
  }
}

TEST(UserCapacity, IsThePowerOfTwoAboveButFor1536) {
  const std::pair<std::uint64_t, std::uint32_t> cases[] = {
      {500, 0},          {1000, 1},         {1024, 2},
      {121'856, 128},    {1'376'255, 2048}, {1'376'256, 1536},
      {1'770'495, 1536}, {1'770'496, 2048}, {0xFFFF'FFFF, 4'194'304},
      {0x7'0000'0400, 2}};
  EXPECT_EQ(GetUserCapacityInGB(0), 0U);
  for (const auto& [megabytes, gigabytes] : cases) {
    EXPECT_EQ(GetUserCapacityInGB(megabytes), gigabytes) << megabytes;
  }
}

}  // namespace
}  // namespace vesprun
