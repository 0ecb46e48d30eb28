#pragma once

#include <functional>
#include <memory>
#include <set>
#include <string>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The endpoint that offers the usage feed.
inline constexpr std::string_view kUsageServiceEndpoint = "com.quill.murmur.usage";

/// The entry of a usage record that holds the date from which its counters count.
inline constexpr std::string_view kUsageSinceKey = "since";

/// What the names of a usage query are.
enum class UsageNameKind { Process, Bundle };

/// The connection to a usage service that feeds are made on.
class UsageWorkspace {
 public:
  virtual ~UsageWorkspace() = default;
};

/// Network usage by process.
class UsageFeed {
 public:
  /// Given the usage records, dictionaries as a rule, or null when the reply is missing. The array
  /// is valid during the call.
  using ReplyHandler = std::function<void(const PropertyArray* records)>;

  virtual ~UsageFeed() = default;

  /// Asks for what the named processes (none: all of them) have sent and received so far, and
  /// returns at once. `reply` is called once, on a thread of the feed, at any later time or never;
  /// it is destroyed there too.
  virtual void usageToDateForNameKindReply(const std::set<std::string>& names, UsageNameKind kind,
                                           ReplyHandler reply) = 0;
};

/// The platform's usage feed.
///
/// A reply may come while the process ends. The platform therefore ends this service before any
/// other: it waits for a handler that is running, and drops the handlers that are still to be
/// called. A handler is safe when it uses only services that may be called from any thread
/// (`Tallybook`, `Preferences`, `PtreeSerialization`,
/// `SystemLog`), by references that it was made with: which platform
/// is installed may change before it runs.
class Murmur {
 public:
  virtual ~Murmur() = default;

  /// Never null.
  virtual std::shared_ptr<UsageWorkspace> createUsageWorkspace(std::string_view endpoint) = 0;

  /// Never null. The feed keeps its workspace.
  virtual std::shared_ptr<UsageFeed> createUsageFeed(std::shared_ptr<UsageWorkspace> workspace) = 0;
};

}  // namespace vesprun
