#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

namespace vesprun {

/// The format of a channel that holds one integer.
inline constexpr std::int64_t kTaplineFormatSimple = 1;

/// What a filter or a visitor says of a channel.
enum class TaplineResult : std::int32_t {
  Continue = 0,  ///< keep the channel; go on
  Remove = 16    ///< take the channel out of the set
};

/// One reporting channel, and in a sample its reading.
class TaplineChannel {
 public:
  virtual ~TaplineChannel() = default;

  virtual std::int64_t TaplineChannelGetFormat() const = 0;
  virtual std::string TaplineChannelGetChannelName() const = 0;
  /// The reading of a channel of the simple format, in a sample; 0 for any other.
  virtual std::int64_t TaplineSimpleGetIntegerValue() const = 0;
};

/// A set of reporting channels, or a sample of them.
class TaplineChannels {
 public:
  using Visitor = std::function<TaplineResult(const TaplineChannel& channel)>;

  virtual ~TaplineChannels() = default;

  /// Removes every channel for which `filter` says so.
  virtual void TaplinePrune(const Visitor& filter) = 0;

  /// Visits the channels in order, until the visitor returns anything but `Continue`.
  virtual void TaplineIterate(const Visitor& visitor) const = 0;
};

/// Reads the channels that were subscribed to.
class TaplineSubscription {
 public:
  virtual ~TaplineSubscription() = default;

  /// One reading of every subscribed channel; null when none can be taken.
  virtual std::unique_ptr<TaplineChannels> TaplineCreateSamples() = 0;
};

/// The kernel's reporting-channel library. Every result belongs to the caller.
class Tapline {
 public:
  virtual ~Tapline() = default;

  /// The channels that are in one of the categories of a mask; null when there are none. What the
  /// selections mean is up to the platform: 1 and 0 select every such channel.
  virtual std::unique_ptr<TaplineChannels> TaplineCopyChannelsInCategories(
      std::uint64_t categoryMask, std::uint64_t firstSelection, std::uint64_t secondSelection) = 0;

  /// Subscribes to channels; null when that failed. `subscribed` becomes the set of those that the
  /// subscription reads, and may stay null.
  virtual std::unique_ptr<TaplineSubscription> TaplineCreateSubscription(
      const TaplineChannels& wanted, std::unique_ptr<TaplineChannels>& subscribed) = 0;
};

}  // namespace vesprun
