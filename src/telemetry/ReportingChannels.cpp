#include "telemetry/ReportingChannels.h"

#include <optional>

#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::uint64_t kDailyLogCategory = 256;

bool isSimple(const TaplineChannel& channel) {
  return channel.TaplineChannelGetFormat() == kTaplineFormatSimple;
}

}  // namespace

void LogTaplineChannelScalars() {
  Tapline& tapline = platform().tapline();
  std::optional<TaplineChannels> channels =
      tapline.TaplineCopyChannelsInCategories(kDailyLogCategory, 1, 0);
  if (!channels) {
    return;
  }
  channels->TaplinePrune([](const TaplineChannel& channel) {
    return isSimple(channel) ? TaplineResult::Continue : TaplineResult::Remove;
  });
  const std::optional<TaplineSubscription> subscription =
      tapline.TaplineCreateSubscription(*channels);
  if (!subscription) {
    return;
  }
  const std::optional<TaplineChannels> samples = tapline.TaplineCreateSamples(*subscription);
  if (!samples) {
    return;
  }
  samples->TaplineIterate([](const TaplineChannel& channel) {
    if (isSimple(channel)) {
      platform().tallybook().TBClientSetValueForScalarKey(
          "com.quill.tapline." + channel.TaplineChannelGetChannelName(),
          channel.TaplineSimpleGetIntegerValue());
    }
    return TaplineResult::Continue;
  });
}

}  // namespace vesprun
