#pragma once

#include "platform/Tapline.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

/// The described reporting channels, in the order of their description, whose readings are the
/// described values; or live ones: the temperatures and pressure stalls of the running system,
/// named and merged as their keys in the table of its figures.
class HostTapline final : public Tapline {
 public:
  explicit HostTapline(const DeviceDescription& description) : _description(description) {}

  std::unique_ptr<TaplineChannels> TaplineCopyChannelsInCategories(
      std::uint64_t categoryMask, std::uint64_t firstSelection,
      std::uint64_t secondSelection) override;
  std::unique_ptr<TaplineSubscription> TaplineCreateSubscription(
      const TaplineChannels& wanted, std::unique_ptr<TaplineChannels>& subscribed) override;

 private:
  const DeviceDescription& _description;
};

}  // namespace vesprun
