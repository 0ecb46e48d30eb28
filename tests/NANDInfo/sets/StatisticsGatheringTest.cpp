#include <algorithm>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/ORUStatsContext.h"
#include "NANDInfo/sets/StatisticsGathering.h"
#include "buffers/DeviceBuffers.h"
#include "support/ControllerTest.h"
#include "support/WatchedRegistry.h"

namespace vesprun {
namespace {

const std::string kQNS3 = "QuillQNS3NVMeController";

class StatisticsGatheringTest : public ControllerTest {};

TEST_F(StatisticsGatheringTest, FTLFailures) {
  const auto expectFailure = [&](const std::string& registry, bool now, const std::string& error) {
    WatchedRegistry watched(start(registry));
    EXPECT_EQ(gatherORUFTLData(false, now, 0), std::nullopt);
    EXPECT_EQ(GetAPIErrorMessage(), error);
    const std::vector<std::string> operations = watched.operations();
    return std::count(operations.begin(), operations.end(), "struct");
  };
  EXPECT_EQ(expectFailure(controller(kQNS3, R"({"opcode": 13, "size": 4})"), true,
                          "gatherORUFTLData: parseFTL failed"),
            2);
  EXPECT_EQ(expectFailure(controller(kQNS3), true, kSizeFailed), 1);
  nand_exporter_t& entry = nand_exporters_tunnel[0];
  const nand_exporter_t complete = entry;
  entry.getStatsSelectors = nullptr;
  entry.getReadStatsSelectors = nullptr;
  const std::string usable = controller(kQNS3, kStatisticsAnswer);
  EXPECT_EQ(expectFailure(usable, true, "gatherORUFTLData: No getStatsSelectors exist"), 0);
  EXPECT_EQ(expectFailure(usable, false, "gatherORUFTLData: No getReadStatsSelectors exist"), 0);
  entry = complete;
}

TEST_F(StatisticsGatheringTest, AnOpenServiceWithoutAConnectionIsAFailure) {
  class Unconnected final : public WatchedRegistry {
   public:
    using WatchedRegistry::WatchedRegistry;
    RegistryResult DevRegServiceOpen(RegistryHandle /*service*/, RegistryHandle& handle) override {
      handle = 0;
      return kRegistrySuccess;
    }
  };
  for (const bool ftl : {true, false}) {
    const Unconnected registry(start(controller(kQNS3, kStatisticsAnswer)));
    EXPECT_EQ(ftl ? gatherORUFTLData(false, true, 0) : gatherORUMSPData(), std::nullopt);
    EXPECT_FALSE(ftl && gatherFTLFields(false, true, 0, [](const FTLFields&) {}));
    EXPECT_EQ(GetAPIErrorMessage(), std::string(ftl ? "gatherORUFTLData" : "gatherORUMSPData") +
                                        ": No io_connection exist");
  }
}

TEST_F(StatisticsGatheringTest, MSPsAreCountedThenFetched) {
  const auto describeMSPs = [](std::uint32_t count, const std::string& last) {
    std::string all = last;
    for (std::uint32_t msp = 0; msp < count; ++msp) {
      all += R"(, {"opcode": 221, "file": "msp.bin", "argument": )" + std::to_string(msp) + '}';
    }
    return controller(kQNS3, all);
  };
  struct Case {
    std::string registry;
    std::size_t expected;  ///< MSPs in the result; `kNothing`: no result
    std::string error;
  };
  constexpr std::size_t kNothing = 99;
  const std::string ending = R"({"opcode": 221, "argument": 3, "file": "msp.bin", "sizeError": 5})";
  const std::string unreadable = R"({"opcode": 221, "argument": 9, "size": 4, "length": 4})";
  const Case cases[] = {
      {describeMSPs(3, ending), 3, kSizeFailed},
      {describeMSPs(12, kStatisticsAnswer), 10, "NA"},
      {describeMSPs(9, unreadable), 9, "gatherORUMSPData: parseMSP failed !"},
      {describeMSPs(0, kStatisticsAnswer), kNothing, kSizeFailed},
  };
  for (const Case& given : cases) {
    start(given.registry);
    MSPBufferBuilder msp;
    msp.add(4096, {7});
    device().write("msp.bin", msp.bytes());
    const std::optional<PropertyDict> fields = gatherORUMSPData();
    EXPECT_EQ(fields ? fields->size() : kNothing, given.expected) << given.registry;
    EXPECT_EQ(GetAPIErrorMessage(), given.error);
    if (fields) {
      EXPECT_EQ(*fields->find("0"), PropertyValue(PropertyDict{{"passWithTmodeHard", 7}}));
      EXPECT_TRUE(fields->contains(std::to_string(given.expected - 1)));
    }
  }
}

TEST_F(StatisticsGatheringTest, BaseStatistics) {
  const std::tuple<std::string, bool, std::size_t, std::string> cases[] = {
      {controller("ORUStorage", kStatisticsAnswer), true, 2, ""},
      {controller(kQNS3, kStatisticsAnswer, R"(, "closeError": 1)"), false, 0,
       "Could not close connection to service\n"},
      {controller(kQNS3, R"({"opcode": 13, "size": 4})"), false, 0, ""},
      {"", false, 3,
       kNoMatch + "Could not get matching DevRegKit service for exporting classes\n"}};
  for (const auto& [registry, filled, entry, errors] : cases) {
    start(registry);
    nand_exporter_t* exporter = nullptr;
    ORUStatsContext context;
    bool result = !filled;
    EXPECT_EQ(errorsOf([&] { result = GatherNANDStats(exporter, context); }), errors);
    EXPECT_EQ(result, filled);
    EXPECT_EQ(exporter, &nand_exporters_tunnel[entry]);
    EXPECT_TRUE(!filled || context.hostWrites == 1000);
  }
}

}  // namespace
}  // namespace vesprun
