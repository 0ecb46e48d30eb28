#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

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
  virtual ~TaplineChannel() = default;

  virtual std::int64_t TaplineChannelGetFormat() const = 0;
  virtual std::string TaplineChannelGetChannelName() const = 0;
  /// The reading, in a sample, of a channel of the simple format; else 0.
  virtual std::int64_t TaplineSimpleGetIntegerValue() const = 0;
};

/// A set of reporting channels, or a sample of them.
class TaplineChannels {
 public:
  using Visitor = std::function<TaplineResult(const TaplineChannel& channel)>;

  virtual ~TaplineChannels() = default;

  /// Removes the channels for which `filter` answers so.
  virtual void TaplinePrune(const Visitor& filter) = 0;

  /// Visits the channels in order until the visitor answers other than `Continue`.
  virtual void TaplineIterate(const Visitor& visitor) const = 0;
};

/// Reads subscribed channels.
class TaplineSubscription {
 public:
  virtual ~TaplineSubscription() = default;

  /// A reading of every subscribed channel; null when none can be taken.
  virtual std::unique_ptr<TaplineChannels> TaplineCreateSamples() = 0;
};

/// The kernel's reporting channels. The caller owns every result.
class Tapline {
 public:
  virtual ~Tapline() = default;

  /// The channels in any category of the mask; null when there are none. Selections are the
  /// platform's own: 1 and 0 select every such channel.
  virtual std::unique_ptr<TaplineChannels> TaplineCopyChannelsInCategories(
      std::uint64_t categoryMask, std::uint64_t firstSelection, std::uint64_t secondSelection) = 0;

  /// Subscribes to channels; null on failure. `subscribed` becomes the set that the subscription
  /// reads, and may stay null.
  virtual std::unique_ptr<TaplineSubscription> TaplineCreateSubscription(
      const TaplineChannels& wanted, std::unique_ptr<TaplineChannels>& subscribed) = 0;
};

}  // namespace vesprun
