#include "telemetry/KernelECCEvents.h"

#include <filesystem>

#include "support/TestDevice.h"
#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

using testing::ElementsAre, testing::EndsWith;

/// An event whose register i holds 256 + i, and 2^63 + 7 as the last.
std::string event(char id, unsigned char count) {
  std::string bytes(72, '\0');
  bytes[0] = id;
  bytes[1] = static_cast<char>(count);
  bytes[2] = '\x55';
  for (std::size_t i = 0; i < 8; ++i) {
    bytes[8 + i * 8] = static_cast<char>(i);
    bytes[8 + i * 8 + 1] = 1;
  }
  bytes[71] = '\x80';
  return bytes;
}

std::vector<PropertyDict> run(TestDevice& device) {
  LogKernelECCEvents();
  return device.lines("records.jsonl");
}

TEST(KernelECCEvents, RecordHoldsTheCountedRegisters) {
  TestDevice device;
  device.write("kernel/ecc/0003.bin", event('\xFF', 9));
  device.write("kernel/ecc/0001.bin", event(1, 0));
  device.write("kernel/ecc/0002.bin", event(2, 3));
  device.write("kernel/ecc/0000.tmp", "no event");
  EXPECT_THAT(run(device), testing::SizeIs(3));
  const std::string start = R"({"time":"2024-03-05T09:15:02Z","type":172,"record":{"id":)";
  const std::string three = R"("reg0":256,"reg1":257,"reg2":258)";
  EXPECT_EQ(device.read("outbox/records.jsonl"),
            start + "1,\"count\":0}}\n" + start + "2,\"count\":3," + three + "}}\n" + start +
                "255,\"count\":9," + three + R"(,"reg3":259,"reg4":260,"reg5":261,"reg6":262,)" +
                "\"reg7\":-9223372036854775545}}\n");
  EXPECT_THAT(device.names("kernel/ecc"), ElementsAre("0000.tmp"));
  EXPECT_THAT(device.log(), ElementsAre());
}

TEST(KernelECCEvents, ARunLogsTenAndTakesOneMore) {
  TestDevice device;
  for (char id = 1; id <= 12; ++id) {
    device.write("kernel/ecc/" + std::to_string(100 + id) + ".bin", event(id, 0));
  }
  EXPECT_THAT(run(device), testing::SizeIs(10));
  EXPECT_THAT(device.names("kernel/ecc"), ElementsAre("112.bin"));
  EXPECT_THAT(device.log(),
              ElementsAre("default: Unexpected errno (0) reading ECC events from kernel"));
  const std::vector<PropertyDict> records = run(device);
  ASSERT_EQ(records.size(), 11U);
  EXPECT_EQ(*records.back().find("record"), PropertyValue(PropertyDict{{"id", 12}, {"count", 0}}));
}

TEST(KernelECCEvents, OnlyUnexpectedErrorsAreTold) {
  const std::pair<int, std::vector<std::string>> cases[] = {
      {2, {}}, {16, {}}, {1, {"default: Unexpected errno (1) reading ECC events from kernel"}}};
  for (const auto& [number, messages] : cases) {
    TestDevice device(deviceWith(R"("kernel": {"eccError": )" + std::to_string(number) + "}"));
    device.write("kernel/ecc/1.bin", event(1, 0));
    EXPECT_THAT(run(device), ElementsAre());
    EXPECT_EQ(device.log(), messages);
    EXPECT_THAT(device.names("kernel/ecc"), ElementsAre("1.bin"));
  }
}

TEST(ECCEventQueue, SetsAsideWhatIsNoEvent) {
  TestDevice device;
  device.write("kernel/ecc/1.bin", event(1, 0).substr(1));
  device.write("kernel/ecc/2.bin/file", "");
  device.write("kernel/ecc/3.bin", event(3, 0));
  EXPECT_THAT(run(device), testing::SizeIs(1));
  EXPECT_THAT(device.names("kernel/ecc"), ElementsAre("1.bin.unusable", "2.bin.unusable"));
  EXPECT_THAT(device.log(), ElementsAre(EndsWith("1.bin: 71 bytes are not an ECC event of 72"),
                                        EndsWith("2.bin: not a regular file")));
}

TEST(ECCEventQueue, KeepsAnEventUntilItsRecordIsWritten) {
  TestDevice device;
  device.write("kernel/ecc/1.bin", event(1, 0));
  device.write("kernel/ecc/2.bin", event(2, 0));
  device.write("outbox/records.jsonl/in/the/way", "");
  LogKernelECCEvents();
  EXPECT_THAT(device.names("kernel/ecc"), ElementsAre("1.bin", "2.bin"));
  std::filesystem::remove_all(device.path("outbox/records.jsonl"));
  EXPECT_THAT(run(device), testing::SizeIs(2));
  EXPECT_THAT(device.names("kernel/ecc"), ElementsAre());
}

}  // namespace
}  // namespace vesprun
