#pragma once

#include <vector>

#include "platform/Tapline.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

/// The described channels, in order, each with a constant reading.
class HostTapline final : public Tapline {
 public:
  explicit HostTapline(const std::vector<ChannelDescription>& channels) : _channels(channels) {}

  std::unique_ptr<TaplineChannels> TaplineCopyChannelsInCategories(
      std::uint64_t categoryMask, std::uint64_t firstSelection,
      std::uint64_t secondSelection) override;
  std::unique_ptr<TaplineSubscription> TaplineCreateSubscription(
      const TaplineChannels& wanted, std::unique_ptr<TaplineChannels>& subscribed) override;

 private:
  const std::vector<ChannelDescription>& _channels;
};

}  // namespace vesprun
