#pragma once

#include "platform/NotificationCenter.h"
#include "platform/host/device/Outbox.h"

namespace vesprun {

/// Posted notifications stand in `outbox/notifications.jsonl`.
class HostNotificationCenter : public NotificationCenter {
 public:
  explicit HostNotificationCenter(Outbox& outbox) : _outbox(outbox) {}

  void PostNotification(std::string_view name) override {
    _outbox.append("notifications.jsonl", {{"name", name}});
  }

 private:
  Outbox& _outbox;
};

}  // namespace vesprun
