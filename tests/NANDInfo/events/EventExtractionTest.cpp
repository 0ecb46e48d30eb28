#include "NANDInfo/EventExtraction.h"

#include "NANDInfo/StatisticsDevice.h"
#include "NANDInfo/events/StorageEvents.h"
#include "NANDInfo/tables/EventFields.h"
#include "vesprun.hpp"

namespace vesprun {
namespace {

using testing::ElementsAreArray;

const std::string kPrefix = "com.quill.massStorage.NANDInfo.";
const char* const kErrorMessage = "com.quill.NANDInfo.ErrorMessage";

const std::string kOtherServices = R"(, {"class": "QuillNVMeEAN", "userClient": {"scalarMethods":
    {"3": {"dBIC": 1, "dLTH": 1}, "7": {"ifw1": 2, "dBIC": 1, "dLTH": 1, "dCfg": 1, "fCfg": 1,
     "nefw": 1, "LPEM": 1}}}},
    {"class": "DevRegDTNVRAMDiags", "properties": {"Generation": 1234}})";

class EventExtractionTest : public StatisticsDevice {
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
      names.push_back(line.find("event")->string()->substr(kPrefix.size()));
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

bool isFieldOf(const std::string& event, const std::string& key) {
  return std::ranges::any_of(EventHubConfigDetails, [&](const StorageEvent& known) {
    return known.event == event && known.fields->contains(key);
  });
}

const std::vector<std::string> kAllEvents{"FTLCounters_1",           "FTLHistograms_1",
                                          "FTLHistograms_2",         "MSPCounters_1",
                                          "MSPCounters_1",           "MSPCounters_1",
                                          "StorageStats_1",          "NORWrites",
                                          "SM.Daily.FTLCounters_1",  "SM.WeeklyMA.FTLCounters_1",
                                          "SM.Monthly.FTLCounters_1"};

TEST_F(EventExtractionTest, AllStepsSendTheirEvents) {
  startWithMagazine();
  const std::optional<PropertyDict> results = NandInfoExtractToEH_runAllSteps(7, true, 1, 0);
  ASSERT_TRUE(results);
  EXPECT_THAT(events(), ElementsAreArray(kAllEvents));

  const std::vector<PropertyDict> lines = device().lines("events.jsonl");
  const auto payload = [&](std::size_t i) { return *lines[i].find("payload")->dict(); };
  for (std::size_t i = 0; i < lines.size(); ++i) {
    std::size_t own = 0;
    std::string others;
    for (const auto& [key, value] : payload(i)) {
      const bool isOwn = isFieldOf(kPrefix + kAllEvents[i], std::string(key));
      own += isOwn ? 1 : 0;
      others += isOwn ? "" : key + ' ';
    }
    EXPECT_EQ(others, i == 7 ? "norwrites " : "") << kAllEvents[i];
    EXPECT_EQ(own == 0, i == 7) << kAllEvents[i];
  }
  const std::tuple<std::size_t, const char*, PropertyValue> figures[] = {
      {0, "hostWrites", 9000},      {1, "gracefulBootTimeLogMs_0", 1},
      {5, "fw_updates", 42},        {5, "msp_index", "2"},
      {5, "total_nof_msps", 3},     {6, "EAN_updateCount_FW", 2},
      {8, "hostWrites", 24.0},      {8, "HLT_instantaneous_gc_wamp_5", 0},
      {9, "HLT_SM_deltaDays", 7.0}, {10, "HLT_SM_deltaDays", 30.0}};
  for (const auto& [i, key, value] : figures) {
    EXPECT_EQ(*payload(i).find(key), value) << key;
  }
  EXPECT_FALSE(payload(9).contains("HLT_instantaneous_gc_wamp_5"));
  EXPECT_EQ(*results->find("hostWrites"), PropertyValue(720.0));
  EXPECT_EQ(*results->find("norwrites"), PropertyValue(1234));
  EXPECT_EQ(*results->find("msp_index"), PropertyValue(payload(5)));
  EXPECT_EQ(*results->find(kErrorMessage), PropertyValue(kSizeFailed));
}

TEST_F(EventExtractionTest, LogsEveryStepWhateverIsTaken) {
  startWithMagazine(R"(, "events": {"used": [")" + kPrefix + R"(MSPCounters_1"], "fails": [")" +
                    kPrefix + R"(FTLHistograms_1", ")" + kPrefix + R"(SM.Daily.FTLCounters_1"]})");
  const std::optional<PropertyDict> results = NandInfoExtractToEH_runAllSteps(0, false, 1, 0);
  const std::string step = "NANDInfo: createAndLogFTLStatFieldsToEventHubForEvent: ";
  EXPECT_THAT(log(),
              testing::AllOf(
                  testing::HasSubstr(step + kPrefix + "FTLHistograms_1 enabled=0\n" + step +
                                     "FAILED to log massStorage_NANDInfo_FTLHistograms_1 using "
                                     "EventHubSendEventLazy\n" +
                                     step + kPrefix + "FTLHistograms_2 enabled=0\nNANDInfo: "),
                  testing::HasSubstr("FAILED to log massStorage_NANDInfo_SM_Daily_FTLCounters_1"),
                  testing::HasSubstr(kPrefix + "MSPCounters_1 enabled=1\n"),
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
  EXPECT_THAT(events(), ElementsAreArray(kAllEvents));
}

TEST_F(EventExtractionTest, FailedMSPEventIsRecorded) {
  for (std::uint32_t msp = 0; msp < 10; ++msp) {
    answer(221, msp, MSPBufferBuilder().add(8202, {msp}).bytes());
  }
  answer(13, 0, StatisticsBufferBuilder().add(680, {1, 2, 3}).bytes());
  startController("QuillQNS3NVMeController",
                  R"(, "events": {"fails": [")" + kPrefix + R"(MSPCounters_1"]})");
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
  EXPECT_EQ(*NandInfoExtractToEH_runAllSteps(0, true, 1, 0)->find(kErrorMessage),
            PropertyValue("gatherORUFTLData: Could not get nand_exporter_t"));
  const std::vector<std::string> sent{"FTLCounters_1", "FTLHistograms_1", "FTLHistograms_2",
                                      "StorageStats_1"};
  EXPECT_THAT(events(), ElementsAreArray(sent));
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
