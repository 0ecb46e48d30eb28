#pragma once

#include <functional>
#include <memory>
#include <set>
#include <string>
#include <string_view>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// The endpoint that offers the usage feed.
inline constexpr std::string_view kUsageServiceEndpoint = "com.quill.murmur.usage";

/// The entry of a usage record with the date on which its counters started.
inline constexpr std::string_view kUsageSinceKey = "since";

/// The kind of name in a usage query.
enum class UsageNameKind { Process, Bundle };

/// A connection to a usage service.
struct UsageWorkspace {
  std::string_view endpoint;
};

/// Network usage by process.
class UsageFeed {
 public:
  /// Called with the usage records, usually dictionaries, or null when the reply is missing. The
  /// array lives as long as the call.
  using ReplyHandler = std::function<void(const PropertyArray* records)>;

  virtual ~UsageFeed() = default;

  /// Asks for the usage so far of the named processes (none: all), and returns at once. `reply` is
  /// called once, later or never, on a thread of the feed, where it is also destroyed.
  virtual void usageToDateForNameKindReply(const std::set<std::string>& names, UsageNameKind kind,
                                           ReplyHandler reply) = 0;
};

/// The platform's usage feed.
///
/// At its end the platform first waits for a running handler of this service and drops the others.
/// A handler may use only services that are safe from any thread (`Tallybook`, `Preferences`,
/// `PtreeSerialization`, `SystemLog`), by references taken before the query: another platform may
/// be installed by then.
class Murmur {
 public:
  virtual ~Murmur() = default;

  /// Never null.
  virtual std::shared_ptr<UsageFeed> createUsageFeed(const UsageWorkspace& workspace) = 0;
};

}  // namespace vesprun
