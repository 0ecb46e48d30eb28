#include "NANDInfo/structuredlog/WriteAmplification.h"

#include <limits>

#include "common/TextForm.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

TEST(WriteAmplification, IsKeptInSinglePrecision) {
  ORUStatsContext statistics;
  statistics.bandErases = 100;
  statistics.pagesPerVirtualBlock = 0x40100;  // times 16384 is 256 times 16384 in 32 bits
  statistics.bytesPerPage = 16384;
  statistics.hostWrites = 30'000;
  statistics.fields.append("pagesPerVirtualBlockSlc", "", 128);
  EXPECT_EQ(writeAmplification(statistics).user, static_cast<float>(102'400.0 / 30'000.0));
  EXPECT_EQ(writeAmplification(statistics).intermediate, 0.0F);
  statistics.fields.append("intermediateBandErases", "", 10);
  EXPECT_EQ(writeAmplification(statistics).intermediate, static_cast<float>(5120.0 / 30'000.0));
  statistics.hostWrites = 0;
  EXPECT_EQ(writeAmplification(statistics).user, std::numeric_limits<float>::infinity());
}

TEST(WriteAmplification, ThresholdIsAFractionBetweenZeroAndTen) {
  using Preference = std::optional<PropertyValue>;
  constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
  const std::pair<Preference, float> above[] = {
      {std::nullopt, 2.1F}, {1.5, 1.8F}, {1.5F, 1.8F}, {12.0, 2.5F}, {10.0, 2.5F}};
  const std::pair<Preference, float> notAbove[] = {
      {std::nullopt, 2.0F}, {1.5, 1.5F}, {12.0, 1.8F},  {9.5, 9.0F},  {0.0, 1.8F}, {-1.0, 1.8F},
      {kNaN, 1.8F},         {1, 1.8F},   {"1.5", 1.8F}, {true, 1.8F}, {1.5, kNaN}};
  TestDevice device;
  const auto isAbove = [&](const std::pair<Preference, float>& each) {
    device.platform().preferences().LGSPreferencesSetValue("userWAmp", each.first,
                                                           "com.quill.NANDInfo");
    return isAboveWriteAmplificationThreshold(each.second);
  };
  EXPECT_THAT(above, testing::Each(testing::Truly(isAbove)));
  EXPECT_THAT(notAbove, testing::Each(testing::Not(testing::Truly(isAbove))));
}

}  // namespace
}  // namespace vesprun
