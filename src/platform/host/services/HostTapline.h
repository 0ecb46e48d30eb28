#pragma once

#include "platform/Tapline.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

/// The described channels, in order, each with a constant reading; or live ones: the temperatures
/// and pressure stalls of the running system, named and merged as in the table of its figures.
class HostTapline final : public Tapline {
 public:
  explicit HostTapline(const DeviceDescription& description) : _description(description) {}

  std::optional<TaplineChannels> TaplineCopyChannelsInCategories(
      std::uint64_t categoryMask, std::uint64_t firstSelection,
      std::uint64_t secondSelection) override;
  std::optional<TaplineSubscription> TaplineCreateSubscription(
      const TaplineChannels& wanted) override {
    return TaplineSubscription{wanted};
  }
  std::optional<TaplineChannels> TaplineCreateSamples(
      const TaplineSubscription& subscription) override {
    return subscription.channels;
  }

 private:
  const DeviceDescription& _description;
};

}  // namespace vesprun
