#include "NANDInfo/sets/HealthFigures.h"

#include "buffers/DeviceBuffers.h"
#include "common/TextForm.h"
#include "support/ControllerTest.h"
#include "vesprun/vesprun.hpp"

namespace vesprun {
namespace {

constexpr std::uint32_t kRaidSmartErrors = 172;
constexpr std::uint32_t kE2EErrors = 280;
constexpr std::uint32_t kUeccReads = 414;
constexpr std::uint32_t kPercentUsed = 431;
constexpr std::uint32_t kSpare = 532;

class HealthSetsTest : public ControllerTest {
 protected:
  void startWith(const std::string& className, const StatisticsBufferBuilder& statistics) {
    answer(13, 0, statistics.bytes());
    startController(className);
  }

  /// "name=value" of each health figure, in order.
  static std::string textOf(const PropertyDict& set) {
    std::string text;
    for (const auto& [key, value] : set) {
      text += key.substr(key.rfind('.') + 1) + '=' + textForm(value) + ' ';
      EXPECT_TRUE(value.string() != nullptr || value.number()->isSigned()) << key;
    }
    return text;
  }
};

TEST_F(HealthSetsTest, FiguresAreReadAsSigned) {
  using Buffer = StatisticsBufferBuilder;
  struct Case {
    std::string className;
    Buffer statistics;
    std::string health;
  };
  const std::string unknown = "NumGrownBadBlocks=-1 SpareAvailablePercent=-1 NumDieFailures=-1 ";
  const std::vector<std::uint64_t> endToEnd{0, 5, 0x1'0000'0003, 0, 0, 0, 0, 0, 0, 0, 0, 6};
  const Buffer used =
      Buffer().add(47, {12}).add(531, {3}).add(kSpare, {98}).add(kE2EErrors, endToEnd);
  const Buffer worn = Buffer().add(429, {7}).add(430, {30}).add(kPercentUsed, {0xFFFF'FFFF});
  const Case cases[] = {
      {"QuillQNS3NVMeController", Buffer().add(4, {1}),
       "MaxPercentageNANDUsed=0 MaxE2EErrors=0 HostReadErrors=0 " + unknown},
      {"ORUStorage", Buffer(worn).add(kRaidSmartErrors, {9}).add(kUeccReads, {0x1'0000'0004}),
       "MaxPercentageNANDUsed=30 MaxE2EErrors=0 HostReadErrors=4294967300 " + unknown},
      {"ORUStorage", Buffer().add(kRaidSmartErrors, {9}).add(kUeccReads, {~std::uint64_t{2}}),
       "MaxPercentageNANDUsed=0 MaxE2EErrors=0 HostReadErrors=0 " + unknown},
      {"QuillEmbeddedNVMeController", Buffer(used).add(kRaidSmartErrors, {9}).add(kUeccReads, {4}),
       "MaxPercentageNANDUsed=0 MaxE2EErrors=6 HostReadErrors=9 NumGrownBadBlocks=12 "
       "SpareAvailablePercent=98 NumDieFailures=3 "}};
  for (const Case& given : cases) {
    startWith(given.className, given.statistics);
    EXPECT_EQ(textOf(gatherNANDHealthInfo()), given.health);
  }
}

TEST_F(HealthSetsTest, RetiredWhenSparesAreUsedUpOrLifeIsOver) {
  const std::array<std::uint64_t, 3> cases[] = {{100, 40, 0}, {99, 40, 1}, {100, 100, 1},
                                                {100, 99, 0}, {0, 0, 1},   {~0ULL, 100, 0}};
  for (const auto& [spare, used, retirable] : cases) {
    startWith("ORUStorage",
              StatisticsBufferBuilder().add(kSpare, {spare}).add(kPercentUsed, {used}));
    EXPECT_EQ(*CopyInternalLabNANDInfo().find("com.quill.NANDInfo.Health.IsNANDRetirable"),
              PropertyValue(retirable))
        << spare << ' ' << used;
  }
}

class ContentDeletionTest : public ControllerTest {};

TEST_F(ContentDeletionTest, AsksControllersThatCanTell) {
  const auto withAnswer = [](const std::string& answer, const std::string& others = "") {
    return controller("ORUStorage", "", R"(, "contentDeletion": )" + answer + others);
  };
  const std::tuple<std::string, bool, std::string> cases[] = {
      {withAnswer(R"({"value": 256})"), true, ""},
      {withAnswer(R"({"value": 1, "length": 5})"), true, ""},
      {withAnswer(R"({"value": 0})"), false, ""},
      {withAnswer(R"({"value": 1, "length": 3})"), false, ""},
      {withAnswer(R"({"value": 1, "error": 5})"), false, ""},
      {withAnswer(R"({"value": 1})", R"(, "closeError": 6)"), true,
       "Could not close connection to service\n"},
      {withAnswer(R"({"value": 1})", R"(, "openError": 6)"), false,
       "Could not get connection to service\n"},
      // Refusing, if they were opened.
      {controller("QuillQNS3NVMeController", "", R"(, "openError": 6)"), false, ""},
      {controller("QuillEmbeddedNVMeController", "", R"(, "openError": 6)"), false, ""},
  };
  for (const auto& [registry, recommends, errors] : cases) {
    start(registry);
    bool result = !recommends;
    EXPECT_EQ(errorsOf([&] { result = NandRecommendsContentDeletion(); }), errors);
    EXPECT_EQ(result, recommends) << registry;
  }
}

}  // namespace
}  // namespace vesprun
