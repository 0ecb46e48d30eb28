#pragma once

#include <memory>

#include "platform/Murmur.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

/// The usage feed: every query is answered with the described records, as late as described, or
/// never, on a thread of its own. The filter of a query is not consulted. When the service ends, it
/// waits for handlers that are running, drops those that are due later, and answers no more.
class HostMurmur final : public Murmur {
 public:
  /// What the references name must outlive the object, and so must all that the handlers use.
  HostMurmur(const AnswerDescription<UsageDescription>& description, SystemLog& log);
  ~HostMurmur() override;
  HostMurmur(const HostMurmur&) = delete;
  HostMurmur& operator=(const HostMurmur&) = delete;

  std::shared_ptr<UsageWorkspace> createUsageWorkspace(std::string_view endpoint) override;
  std::shared_ptr<UsageFeed> createUsageFeed(std::shared_ptr<UsageWorkspace> workspace) override;

 private:
  class Replies;
  class Feed;

  std::shared_ptr<Replies> _replies;
};

}  // namespace vesprun
