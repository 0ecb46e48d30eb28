#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace vesprun {

/// The format of a channel that holds one integer.
inline constexpr std::int64_t kTaplineFormatSimple = 1;

/// The answer of a filter or visitor.
enum class TaplineResult : std::int32_t {
  Continue = 0,  ///< keep the channel; go on
  Remove = 16    ///< take the channel out of the set
};

/// A reporting channel, or its reading in a sample.
class TaplineChannel {
 public:
  TaplineChannel(std::string name, std::int64_t format, std::int64_t reading)
      : _name(std::move(name)), _format(format), _reading(reading) {}

  std::int64_t TaplineChannelGetFormat() const { return _format; }
  const std::string& TaplineChannelGetChannelName() const { return _name; }
  /// The reading, in a sample, of a channel of the simple format; else 0.
  std::int64_t TaplineSimpleGetIntegerValue() const {
    return _format == kTaplineFormatSimple ? _reading : 0;
  }

 private:
  std::string _name;
  std::int64_t _format;
  std::int64_t _reading;
};

/// A set of reporting channels, or a sample of them.
class TaplineChannels {
 public:
  using Visitor = std::function<TaplineResult(const TaplineChannel& channel)>;

  explicit TaplineChannels(std::vector<TaplineChannel> channels) : _channels(std::move(channels)) {}

  /// Removes the channels for which `filter` answers so.
  void TaplinePrune(const Visitor& filter) {
    std::erase_if(_channels, [&](const TaplineChannel& channel) {
      return filter(channel) == TaplineResult::Remove;
    });
  }

  /// Visits the channels in order until the visitor answers other than `Continue`.
  void TaplineIterate(const Visitor& visitor) const {
    for (const TaplineChannel& channel : _channels) {
      if (visitor(channel) != TaplineResult::Continue) {
        return;
      }
    }
  }

 private:
  std::vector<TaplineChannel> _channels;
};

/// The channels that are read.
struct TaplineSubscription {
  TaplineChannels channels;
};

/// The kernel's reporting channels.
class Tapline {
 public:
  virtual ~Tapline() = default;

  /// The channels in any category of the mask; nothing if it matches none. Selections are the
  /// platform's own: 1 and 0 select every such channel.
  virtual std::optional<TaplineChannels> TaplineCopyChannelsInCategories(
      std::uint64_t categoryMask, std::uint64_t firstSelection, std::uint64_t secondSelection) = 0;

  /// Subscribes to channels; nothing on failure.
  virtual std::optional<TaplineSubscription> TaplineCreateSubscription(
      const TaplineChannels& wanted) = 0;

  /// A reading of every subscribed channel; nothing when none can be taken.
  virtual std::optional<TaplineChannels> TaplineCreateSamples(
      const TaplineSubscription& subscription) = 0;
};

}  // namespace vesprun
