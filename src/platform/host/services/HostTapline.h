#pragma once

#include "platform/Tapline.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/figures/FigureReader.h"

namespace vesprun {

/// The described channels, in order, each with a constant reading; or live ones: the temperatures
/// and pressure stalls of the running system, named and merged as in the table of its figures.
class HostTapline final : public Tapline {
 public:
  explicit HostTapline(const DeviceDescription& description) : _description(description) {}

  std::optional<TaplineChannels> TaplineCopyChannelsInCategories(
      std::uint64_t categoryMask, std::uint64_t /*firstSelection*/,
      std::uint64_t /*secondSelection*/) override {
    std::vector<TaplineChannel> selected;
    for (const auto& [name, value, format, categories] :
         _description.liveChannels ? liveChannels() : _description.channels) {
      if ((categories & categoryMask) != 0) {
        selected.emplace_back(name, format, value);
      }
    }
    return selected.empty() ? std::nullopt : std::optional(TaplineChannels(std::move(selected)));
  }
  std::optional<TaplineSubscription> TaplineCreateSubscription(
      const TaplineChannels& wanted) override {
    return TaplineSubscription{wanted};
  }
  std::optional<TaplineChannels> TaplineCreateSamples(
      const TaplineSubscription& subscription) override {
    return subscription.channels;
  }

 private:
  static std::vector<ChannelDescription> liveChannels() {
    const auto isChannel = [](const LinuxFigure& figure) {
      return figure.key.starts_with("linux.temperature.") ||
             figure.key.starts_with("linux.pressure.");
    };
    std::vector<ChannelDescription> channels;
    for (const auto& [name, value] : mergedFigures(isChannel)) {
      channels.push_back({name, value});
    }
    return channels;
  }

  const DeviceDescription& _description;
};

}  // namespace vesprun
