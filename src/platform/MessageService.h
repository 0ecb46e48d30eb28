#pragma once

#include <functional>
#include <memory>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// One peer of a named message service. Its messages are delivered on the main thread, while the
/// main loop runs.
class PeerConnection {
 public:
  /// Given each message, of whatever type.
  using MessageHandler = std::function<void(const PropertyValue& message)>;

  virtual ~PeerConnection() = default;

  virtual void setMessageHandler(MessageHandler handler) = 0;
  virtual void start() = 0;
};

/// Accepts the peers of one named message service.
class ServiceListener {
 public:
  /// Given each new peer, on the main thread. The peer belongs to the service; a peer that the
  /// handler does not start is turned away.
  using PeerHandler = std::function<void(PeerConnection& peer)>;

  virtual ~ServiceListener() = default;

  virtual void setPeerHandler(PeerHandler handler) = 0;
  virtual void start() = 0;
};

class MessageService {
 public:
  virtual ~MessageService() = default;

  /// A listener that offers the named service until it is destroyed. Null when it cannot be
  /// created, for instance because another process offers the service; the system log says why.
  virtual std::unique_ptr<ServiceListener> createListener(std::string_view name) = 0;
};

}  // namespace vesprun
