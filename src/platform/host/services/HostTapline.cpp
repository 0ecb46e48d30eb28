#include "platform/host/services/HostTapline.h"

#include <map>

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

}  // namespace

std::optional<TaplineChannels> HostTapline::TaplineCopyChannelsInCategories(
    std::uint64_t categoryMask, std::uint64_t /*firstSelection*/,
    std::uint64_t /*secondSelection*/) {
  std::vector<TaplineChannel> selected;
  for (const auto& [name, value, format, categories] :
       _description.liveChannels ? liveChannels() : _description.channels) {
    if ((categories & categoryMask) != 0) {
      selected.emplace_back(name, format, value);
    }
  }
  return selected.empty() ? std::nullopt : std::optional(TaplineChannels(std::move(selected)));
}

}  // namespace vesprun
