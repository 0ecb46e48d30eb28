#include "platform/host/services/HostTapline.h"

#include <map>
#include <utility>
#include <vector>

#include "platform/host/figures/FigureReader.h"

namespace vesprun {
namespace {

std::vector<ChannelDescription> liveChannels() {
  const auto isChannel = [](const LinuxFigure& figure) {
    return figure.key.starts_with("linux.temperature.") ||
           figure.key.starts_with("linux.pressure.");
  };
  std::map<std::string, std::int64_t> values;
  for (const FigureReading& reading : readFigures("", isChannel).figures) {
    mergeFigure(values, *reading.figure, reading.key, reading.value);
  }
  std::vector<ChannelDescription> channels;
  channels.reserve(values.size());
  for (const auto& [name, value] : values) {
    channels.push_back({name, value});
  }
  return channels;
}

class HostChannel final : public TaplineChannel {
 public:
  explicit HostChannel(ChannelDescription description) : _description(std::move(description)) {}

  std::int64_t TaplineChannelGetFormat() const override { return _description.format; }
  std::string TaplineChannelGetChannelName() const override { return _description.name; }
  std::int64_t TaplineSimpleGetIntegerValue() const override {
    return _description.format == kTaplineFormatSimple ? _description.value : 0;
  }

 private:
  ChannelDescription _description;
};

class HostChannels final : public TaplineChannels {
 public:
  explicit HostChannels(std::vector<HostChannel> channels) : _channels(std::move(channels)) {}

  void TaplinePrune(const Visitor& filter) override {
    std::erase_if(_channels, [&](const HostChannel& channel) {
      return filter(channel) == TaplineResult::Remove;
    });
  }

  void TaplineIterate(const Visitor& visitor) const override {
    for (const HostChannel& channel : _channels) {
      if (visitor(channel) != TaplineResult::Continue) {
        return;
      }
    }
  }

 private:
  std::vector<HostChannel> _channels;
};

class HostSubscription final : public TaplineSubscription {
 public:
  explicit HostSubscription(HostChannels channels) : _channels(std::move(channels)) {}

  std::unique_ptr<TaplineChannels> TaplineCreateSamples() override {
    return std::make_unique<HostChannels>(_channels);
  }

 private:
  HostChannels _channels;
};

}  // namespace

std::unique_ptr<TaplineChannels> HostTapline::TaplineCopyChannelsInCategories(
    std::uint64_t categoryMask, std::uint64_t /*firstSelection*/,
    std::uint64_t /*secondSelection*/) {
  std::vector<HostChannel> selected;
  for (ChannelDescription& channel :
       _description.liveChannels ? liveChannels() : std::vector(_description.channels)) {
    if ((channel.categories & categoryMask) != 0) {
      selected.emplace_back(std::move(channel));
    }
  }
  return selected.empty() ? nullptr : std::make_unique<HostChannels>(std::move(selected));
}

std::unique_ptr<TaplineSubscription> HostTapline::TaplineCreateSubscription(
    const TaplineChannels& wanted, std::unique_ptr<TaplineChannels>& subscribed) {
  const auto* channels = dynamic_cast<const HostChannels*>(&wanted);
  if (channels == nullptr) {
    return nullptr;
  }
  subscribed = std::make_unique<HostChannels>(*channels);
  return std::make_unique<HostSubscription>(*channels);
}

}  // namespace vesprun
