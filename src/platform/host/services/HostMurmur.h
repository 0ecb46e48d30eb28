#pragma once

#include <memory>

#include "platform/Murmur.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

/// Answers every query, whatever its filter, with the described records, as late as described or
/// never, on a thread of its own. When it ends, it waits for running handlers and drops the others.
class HostMurmur final : public Murmur {
 public:
  /// The references, and all that handlers use, must outlive the object.
  HostMurmur(const DeviceDescription& description, SystemLog& log);
  ~HostMurmur() override;
  HostMurmur(const HostMurmur&) = delete;
  HostMurmur& operator=(const HostMurmur&) = delete;

  std::shared_ptr<UsageFeed> createUsageFeed(const UsageWorkspace& workspace) override;

 private:
  class Feed;

  std::shared_ptr<Feed> _feed;
};

}  // namespace vesprun
