#include "telemetry/ReportingChannels.h"

#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

TEST(ReportingChannels, OnlySimpleChannelsOfTheCategoryAreWritten) {
  for (const char* others : {"", R"(, {"name": "TempMax", "value": 41},
                 {"name": "Low", "value": -7, "format": 1, "categories": 257})"}) {
    TestDevice device(deviceWith(std::string(R"("channels": [
        {"name": "Histogram", "value": 9, "format": 3},
        {"name": "OfAnotherCategory", "value": 9, "categories": 255})") +
                                 others + "]"));
    LogTaplineChannelScalars();
    const Scalars written{{"com.quill.tapline.Low", -7}, {"com.quill.tapline.TempMax", 41}};
    EXPECT_EQ(todaysScalars(device), *others == '\0' ? Scalars{} : written);
  }
}

}  // namespace
}  // namespace vesprun
