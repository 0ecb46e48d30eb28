#include "NANDInfo/sets/LegacyNANDInfo.h"

#include "NANDInfo/controller/EANQueries.h"
#include "NANDInfo/controller/NandExporter.h"
#include "NANDInfo/sets/StorageHealthFields.h"
#include "support/ControllerTest.h"
#include "vesprun/vesprun.hpp"

namespace vesprun {
namespace {

const std::string kUsable = controller("QuillQNS3NVMeController", kStatisticsAnswer);
const PropertyDict kUnableToParse{{"com.quill.NANDInfo.Error", "1"},
                                  {"com.quill.NANDInfo.ErrorMessage", "Unable to parse buffer"}};

std::string session(const std::string& identifier) {
  return R"(, "kernel": {"variables": {"kern.bootsessionuuid": )" + identifier + "}}";
}

class CopyNANDInfoTest : public ControllerTest {};

TEST_F(CopyNANDInfoTest, DayParityFollowsTheBootSession) {
  const std::pair<std::string, bool> onOddDay[] = {
      {"\"7A\"", true},  {"\"0A\"", false},        {"\"9\"", true},
      {"\"A1\"", false}, {"\"B1\"", true},         {"\"F0\"", true},
      {"\"b1\"", false}, {"\"G\"", false},         {"\":\"", false},
      {"\"\"", false},   {"{\"u32\": 55}", false}, {'"' + std::string(100, '7') + '"', false}};
  for (const auto& [identifier, all] : onOddDay) {
    start("", session(identifier));
    EXPECT_EQ(NandInfoShouldLogAllToEH(), all) << identifier;
  }
  for (const auto& [identifier, all] :
       {std::pair{"\"7\"", false}, std::pair{"\"A\"", true}, std::pair{"\"b\"", true}}) {
    start("", session(identifier), "2022-01-08T12:00:00Z");  // day 19000, an even one
    EXPECT_EQ(NandInfoShouldLogAllToEH(), all) << identifier;
  }
}

TEST_F(CopyNANDInfoTest, PurgeableSpace) {
  struct Case {
    std::string others;
    PropertyDict info;
    std::string error = "NA";
  };
  const Case cases[] = {
      {"", {}},
      {R"(, "purgeable": null)",
       {},
       "getReclaimerInfo: unable to get output from ReclaimerCopyItemizedPurgeableSpaceWithInfo"},
      {R"(, "purgeable": {"RECLAIMER_TOTAL_AVAILABLE": 5, "Other": 1})",
       {{"HLT_Reclaimer_totalPurgeable", 5}}},
      {R"(, "purgeable": {"RECLAIMER_NONPURGEABLE_AMOUNT": 6, "RECLAIMER_TOTAL_AVAILABLE": 5})",
       {{"HLT_Reclaimer_totalPurgeable", 5}, {"HLT_Reclaimer_totalNonPurgeable", 6}}},
      {R"(, "purgeable": {"RECLAIMER_TOTAL_AVAILABLE": 5,
                          "com.quill.NANDInfo.Reclaimer.Error": 1})",
       {}}};
  for (const Case& given : cases) {
    start(kUsable, given.others);
    EXPECT_EQ(getReclaimerInfo(), given.info) << given.others;
    EXPECT_EQ(GetAPIErrorMessage(), given.error);
    const PropertyDict info = CopyNANDInfo();
    const PropertyValue* purgeable = info.find("com.quill.NANDInfo.Reclaimer.TotalPurgeableBytes");
    const PropertyValue* fixed = info.find("com.quill.NANDInfo.Reclaimer.TotalNonPurgeableBytes");
    EXPECT_EQ(purgeable != nullptr, given.info.contains("HLT_Reclaimer_totalPurgeable"));
    EXPECT_EQ(fixed != nullptr, given.info.contains("HLT_Reclaimer_totalNonPurgeable"));
    EXPECT_EQ(info.find("com.quill.NANDInfo.ExportVersion")->number()->asUInt64(), 17u);
  }
}

TEST_F(CopyNANDInfoTest, DailyLogHasItOnOtherDays) {
  start(kUsable, session("\"7\""));
  EXPECT_EQ(CopyNANDInfoWithOptions({}), PropertyDict());
  EXPECT_TRUE(device().log().empty());

  start(kUsable, session("\"8\""));
  EXPECT_EQ(CopyNANDInfoWithOptions({}), CopyNANDInfo());
  const std::string step = "default: NANDInfo: CopyNANDInfoWithOptions: ";
  EXPECT_THAT(device().log(), testing::IsSupersetOf({step + "obtaining FTL data for TLYD\n",
                                                     step + "returning TLYD dictionary\n"}));

  start("", session("\"8\""));
  EXPECT_EQ(CopyNANDInfoWithOptions({}), kUnableToParse);
  EXPECT_EQ(GetAPIErrorMessage(), "NA");
}

TEST_F(CopyNANDInfoTest, DumpAddsToWhatIsThere) {
  start(kUsable);
  PropertyDict info{{"com.quill.NANDInfo.NumLogicalWrites", "old"}, {"mine", 1}};
  DumpNANDInfo(info);
  EXPECT_EQ(*info.find("com.quill.NANDInfo.NumLogicalWrites"), PropertyValue(1000));
  EXPECT_EQ(*info.find("mine"), PropertyValue(1));
  EXPECT_FALSE(info.contains("com.quill.NANDInfo.ExportVersion"));
  EXPECT_FALSE(info.contains("com.quill.NANDInfo.DemoMode"));
}

TEST_F(CopyNANDInfoTest, RawFTLFieldsAreReadWhenTheyAreWanted) {
  start(kUsable);
  EXPECT_EQ(CopyNANDFTLInfo(false, 0), std::nullopt);
  EXPECT_EQ(GetAPIErrorMessage(), "NA");
}

TEST_F(CopyNANDInfoTest, StoredImages) {
  constexpr std::uint32_t kCode = 0x4C50454D;
  const auto service = [](const std::string& userClient) {
    return R"({"class": "QuillNVMeEAN", "userClient": {)" + userClient + "}}";
  };
  const std::string unable =
      ": Unable to get EAN Io service connection for key (1280329037): LPEM\n";
  const std::string failed =
      ": DevRegConnectCallMethod failed (key (1280329037): LPEM) kernResult:";
  const std::string none = "default: getEANConnection: Couldn't find QuillNVMeEAN object\n";
  const std::string refused =
      "default: getEANConnection: DevRegServiceOpen on QuillNVMeEAN failed kernResult:e00002c5\n";
  const std::pair<std::string, std::string> cases[] = {
      {service(R"("scalarMethods": {"3": {"LPEM": 4294967297}, "7": {"LPEM": 8}})"),
       "4294967297 8 "},
      {service(R"("closeError": 1, "scalarMethods": {"3": {"dBIC": 1}})"),
       "0 0 default: GetImageSize" + failed + "e00002bc\ndefault: GetUpdateCount" + failed +
           "e00002c2\n"},
      {"", "0 0 " + none + "default: GetEANImageSize" + unable + none +
               "default: GetEANUpdateCount" + unable},
      {service(R"("openError": 3758097093)"), "0 0 " + refused + "default: GetEANImageSize" +
                                                  unable + refused + "default: GetEANUpdateCount" +
                                                  unable}};
  for (const auto& [registry, expected] : cases) {
    start(registry);
    std::string text = std::to_string(GetEANImageSize(kCode)) + ' ';
    text += std::to_string(GetEANUpdateCount(kCode)) + ' ';
    for (const std::string& line : device().log()) {
      text += line;
    }
    EXPECT_EQ(text, expected);
  }
}

TEST_F(CopyNANDInfoTest, AnyFailingCallLeavesNothingOpen) {
  start(kUsable + R"(, {"matching": false, )" + controller("ORUStorage").substr(1));
  failEveryCall([] { CopyNANDInfo(); }, 3);
  const auto connect = [] {
    ORUConnection connection;
    openORUConnection(connection);
    closeORUConnection(connection);
  };
  failEveryCall(connect, 3);
  const auto find = [] {
    platform().deviceRegistry().DevRegObjectRelease(FindServiceUsingIterator("ORUStorage"));
  };
  failEveryCall(find, 3);
}

}  // namespace
}  // namespace vesprun
