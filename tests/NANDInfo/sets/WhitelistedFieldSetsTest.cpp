#include "vesprun.hpp"

#include "NANDInfo/StatisticsDevice.h"

namespace vesprun {
namespace {

using Statistics = StatisticsBufferBuilder;

class WhitelistedFieldSetsTest : public StatisticsDevice {};

TEST_F(WhitelistedFieldSetsTest, EachMSPHasTheDerivedFieldsUnrounded) {
  const Bytes msp =
      MSPBufferBuilder().add(8202, {12'345}).add(16'384, {0xFFFF'0003'0002'0001}).bytes();
  answer(221, 0, msp);
  answer(221, 1, MSPBufferBuilder().add(8202, {7}).bytes());
  answer(13, 0, Statistics().add(4, {1'234'567'890}).add(680, {1, 2, 3}).bytes());
  startController();
  const std::string derived =
      R"(,"HLT_OR_Diskfullness_BP":7500,"HLT_OR_Capacity_GB":64,"HLT_hostWrites":1234567890,)"
      R"("HLT_numBootBlockRefreshes_max":0,"HLT_OR_AmountDataAvailable_MB":15258,)"
      R"("HLT_Capacity_GB":64,"HLT_Diskfullness_BP":7500,"HLT_UserCapacity_MB":61035)";
  const std::string error = R"("HLT_APIErrorMessage":")" + kSizeFailed + "\"}";
  EXPECT_EQ(jsonText(CopyWhitelistedNANDMSPInfo(true)),
            R"({"0":{"fw_updates":12300,"fw_version_identifier":18446462611617873921)" + derived +
                R"(,"fw_version_identifier_0":1,"fw_version_identifier_1":2,)"
                R"("fw_version_identifier_2":3,"fw_version_identifier_3":65535},)"
                R"("1":{"fw_updates":7)" +
                derived + "}," + error);
}

TEST_F(WhitelistedFieldSetsTest, StorageStatsAskForEveryImage) {
  const std::string images = R"(, {"class": "QuillNVMeEAN", "userClient": {"scalarMethods": {
      "3": {"dBIC": 1234567, "dLTH": 2},
      "7": {"ifw1": 3, "dBIC": 4, "dLTH": 5, "dCfg": 6, "fCfg": 7, "nefw": 8, "LPEM": 9}}}})";
  answer(13, 0, Statistics().add(581, {22}).add(582, {11}).add(34, {9}).bytes());
  startController("ORUStorage", "", images);
  const auto expected = [](const std::string& size) {
    return R"({"HLT_OR_Capacity_GB":64,"HLT_averageSLCPECycles":11,"HLT_averageTLCPECycles":22,)"
           R"("HLT_OR_Diskfullness_BP":7500,"EAN_imageSize_BIC":)" +
           size +
           R"(,"EAN_imageSize_LTH":2,"EAN_updateCount_FW":3,"EAN_updateCount_BIC":4,)"
           R"("EAN_updateCount_LTH":5,"EAN_updateCount_dConfig":6,"EAN_updateCount_fConfig":7,)"
           R"("EAN_updateCount_NonEssentialFW":8,"EAN_updateCount_LowPowerEM":9,)"
           R"("HLT_APIErrorMessage":"Stat Magazine not supported"})";
  };
  EXPECT_EQ(jsonText(CopyWhitelistedStorageStats(false)), expected("1234567"));
  EXPECT_EQ(jsonText(CopyWhitelistedStorageStats(true)), expected("1234600"));
}

}  // namespace
}  // namespace vesprun
