#include "telemetry/ReportingChannels.h"

#include <algorithm>

#include "platform/host/figures/FigureReader.h"
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

TEST(ReportingChannels, NothingIsWrittenWithoutASubscriptionOrASample) {
  struct Unreadable final : Tapline {
    Unreadable(Tapline& platforms, bool does) : tapline(platforms), subscribes(does) {}
    std::optional<TaplineChannels> TaplineCopyChannelsInCategories(std::uint64_t mask,
                                                                   std::uint64_t first,
                                                                   std::uint64_t second) override {
      return tapline.TaplineCopyChannelsInCategories(mask, first, second);
    }
    std::optional<TaplineSubscription> TaplineCreateSubscription(
        const TaplineChannels& wanted) override {
      return subscribes ? std::optional(TaplineSubscription{wanted}) : std::nullopt;
    }
    std::optional<TaplineChannels> TaplineCreateSamples(
        const TaplineSubscription& /*subscription*/) override {
      return std::nullopt;
    }
    Tapline& tapline;
    bool subscribes;
  };
  TestDevice device(deviceWith(R"("channels": [{"name": "c", "value": 3}])"));
  Tapline& real = device.platform().tapline();
  Unreadable unsubscribed(real, false);
  Unreadable unsampled(real, true);
  for (Tapline* unreadable : {&unsubscribed, &unsampled}) {
    device.platform().tapline = *unreadable;
    LogTaplineChannelScalars();
  }
  EXPECT_EQ(todaysScalars(device), Scalars{});
}

TEST(ReportingChannels, LiveOnesAreThoseOfTheRunningSystem) {
  TestDevice device(deviceWith(R"("channels": "live")"));
  LogTaplineChannelScalars();
  Scalars channels;
  for (const FigureReading& reading : readFigures("", [](const LinuxFigure& figure) {
                                        return figure.key.starts_with("linux.temperature.") ||
                                               figure.key.starts_with("linux.pressure.");
                                      }).figures) {
    mergeFigure(channels, *reading.figure, "com.quill.tapline." + reading.key, reading.value);
  }
  const Scalars written = todaysScalars(device);
  EXPECT_TRUE(std::ranges::equal(written, channels, {}, &Scalars::value_type::first,
                                 &Scalars::value_type::first));
  for (const auto& [key, value] : written) {
    EXPECT_NEAR(static_cast<double>(value), static_cast<double>(channels[key]), 1000) << key;
  }
}

}  // namespace
}  // namespace vesprun
