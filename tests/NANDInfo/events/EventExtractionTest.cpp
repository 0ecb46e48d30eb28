#include "vesprun/EventExtraction.h"

#include "NANDInfo/events/StorageEvents.h"
#include "buffers/DeviceBuffers.h"
#include "support/ControllerTest.h"
#include "vesprun/vesprun.hpp"

namespace vesprun {
namespace {

const std::string kEventPrefix = "com.quill.massStorage.NANDInfo.";
const char* const kErrorMessage = "com.quill.NANDInfo.ErrorMessage";

const std::string kOtherServices = R"(, {"class": "QuillNVMeEAN", "userClient": {"scalarMethods":
    {"3": {"dBIC": 1, "dLTH": 1}, "7": {"ifw1": 2, "dBIC": 1, "dLTH": 1, "dCfg": 1, "fCfg": 1,
     "nefw": 1, "LPEM": 1}}}},
    {"class": "DevRegDTNVRAMDiags", "properties": {"Generation": 1234}})";

class EventExtractionTest : public ControllerTest {
 protected:
  /// A controller with three MSPs, everything that the events are made from and a magazine.
  void startWithMagazine(const std::string& others = "") {
    const auto statistics = [](std::uint64_t hours) {
      return StatisticsBufferBuilder()
          .add(4, {9000 - hours})
          .add(680, {1, 2, 3})
          .add(235, {1, 0, 0, 0, 0, 0, 0, 0})
          .add(677, {(2'000'000'000 - hours * 3600) << 24})
          .bytes();
    };
    answer(13, 0, statistics(0));
    for (const std::uint32_t hours : {0U, 4U, 8U, 12U, 16U, 20U, 24U, 168U, 720U}) {
      answer(10, hours, statistics(hours));
    }
    for (std::uint32_t msp = 0; msp < 3; ++msp) {
      answer(221, msp, MSPBufferBuilder().add(8202, {msp + 40}).bytes());
    }
    startController("QuillQNS3NVMeController", others, kOtherServices);
  }

  std::vector<std::string> events() {
    std::vector<std::string> names;
    for (const PropertyDict& line : device().lines("events.jsonl")) {
      names.push_back(line.find("event")->string()->substr(kEventPrefix.size()));
    }
    return names;
  }
  /// The messages of default level, one behind the other.
  std::string log() {
    constexpr std::string_view kLevel = "default: ";
    std::string text;
    for (const std::string& line : device().log()) {
      text += line.starts_with(kLevel) ? line.substr(kLevel.size()) : "";
    }
    return text;
  }
};

TEST_F(EventExtractionTest, LogsEveryStepWhateverIsTaken) {
  startWithMagazine(R"(, "events": {"used": [")" + kEventPrefix +
                    R"(MSPCounters_1"], "fails": [")" + kEventPrefix + R"(FTLHistograms_1", ")" +
                    kEventPrefix + R"(SM.Daily.FTLCounters_1"]})");
  const std::optional<PropertyDict> results = NandInfoExtractToEH_runAllSteps(0, false, 1, 0);
  const std::string step = "NANDInfo: createAndLogFTLStatFieldsToEventHubForEvent: ";
  EXPECT_THAT(log(),
              testing::AllOf(
                  testing::HasSubstr(step + kEventPrefix + "FTLHistograms_1 enabled=0\n" + step +
                                     "FAILED to log massStorage_NANDInfo_FTLHistograms_1 using "
                                     "EventHubSendEventLazy\n" +
                                     step + kEventPrefix + "FTLHistograms_2 enabled=0\nNANDInfo: "),
                  testing::HasSubstr("FAILED to log massStorage_NANDInfo_SM_Daily_FTLCounters_1"),
                  testing::HasSubstr(kEventPrefix + "MSPCounters_1 enabled=1\n"),
                  testing::EndsWith("\nSkipping Stats Mag Monthly Delta")));
  EXPECT_EQ(events().size(), 3u);
  EXPECT_FALSE(results->contains("gracefulBootTimeLogMs_0"));
  EXPECT_EQ(*results->find("hostWrites"), PropertyValue(168.0));
}

TEST_F(EventExtractionTest, StepsThatCannotSend) {
  struct Case {
    std::string others;
    std::uint32_t firstStep;
    std::string error, log;
  };
  const std::string skipping = "Skipping Stats Mag Monthly Delta";
  const std::string step = "NANDInfo: NandInfoExtractToEH_runStep: ";
  const Case cases[] = {{R"(, "events": {"available": false})", 0, "NA", skipping},
                        {"", 6, "NA", skipping},
                        {"", 7, "NANDInfo: unable to log FTL counters to EH",
                         step + "logging FTL counters\n" + step + "unable to log FTL counters\n"},
                        {"", 0xFFFF'FFFF, "NA", ""}};
  for (const Case& given : cases) {
    startWithMagazine(given.others);
    EXPECT_EQ(NandInfoExtractToEH_runAllSteps(0, false, 1, given.firstStep),
              (PropertyDict{{kErrorMessage, given.error}}));
    EXPECT_EQ(log(), given.log);
    EXPECT_TRUE(events().empty());
  }
  startWithMagazine();
  EXPECT_EQ(NandInfoExtractToEH_runAllSteps(0, true, 0, 0), std::nullopt);
  EXPECT_THAT(events(), testing::SizeIs(11));
}

TEST_F(EventExtractionTest, FailedMSPEventIsRecorded) {
  for (std::uint32_t msp = 0; msp < 10; ++msp) {
    answer(221, msp, MSPBufferBuilder().add(8202, {msp}).bytes());
  }
  answer(13, 0, StatisticsBufferBuilder().add(680, {1, 2, 3}).bytes());
  startController("QuillQNS3NVMeController",
                  R"(, "events": {"fails": [")" + kEventPrefix + R"(MSPCounters_1"]})");
  EXPECT_FALSE(NandInfoExtractToEH_runAllSteps(0, false, 1, 1)->contains("msp_index"));
  EXPECT_EQ(GetAPIErrorMessage(),
            "createAndLogMSPFieldsToEventHubForEvent: EventHubSendEventLazy failed to log to EH");
}

TEST_F(EventExtractionTest, WithoutAController) {
  start("");
  EXPECT_EQ(createAndLogSMagFTLFieldsToEventHubForEvent(2),
            (PropertyDict{{kErrorMessage, "Stats Magazine not supported"}}));
  EXPECT_EQ(createAndLogSMagFTLFieldsToEventHubForEvent(3),
            (PropertyDict{{kErrorMessage, "Wrong SM delta type"}}));
  EXPECT_EQ(log(), "Unexpected SM delta type 3");
}

TEST_F(EventExtractionTest, AnyFailingCallLeavesNothingOpen) {
  startWithMagazine();
  failEveryCall([] { CopyWhitelistedNANDMSPInfo(true); }, 5);
  failEveryCall([] { CopyWhitelistedStorageStats(true); }, 5);
  failEveryCall([] { CopySMagNANDFTLInfo(24, 1, 2); }, 5);
  failEveryCall([] { CopySMagNANDFTLCustomHistoryInfo(0); }, 5);
  start(controller("ORUStorage", "", R"(, "contentDeletion": {"value": 1})"));
  failEveryCall([] { NandRecommendsContentDeletion(); }, 5);
}

}  // namespace
}  // namespace vesprun
