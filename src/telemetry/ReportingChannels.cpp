#include "telemetry/ReportingChannels.h"

#include <memory>

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
  const std::unique_ptr<TaplineChannels> channels =
      tapline.TaplineCopyChannelsInCategories(kDailyLogCategory, 1, 0);
  if (!channels) {
    return;
  }
  channels->TaplinePrune([](const TaplineChannel& channel) {
    return isSimple(channel) ? TaplineResult::Continue : TaplineResult::Remove;
  });
  std::unique_ptr<TaplineChannels> subscribed;
  const std::unique_ptr<TaplineSubscription> subscription =
      tapline.TaplineCreateSubscription(*channels, subscribed);
  if (!subscription) {
    return;
  }
  const std::unique_ptr<TaplineChannels> samples = subscription->TaplineCreateSamples();
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
