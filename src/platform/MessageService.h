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

  /// To be called before `start`; a message without a handler is dropped.
  virtual void setMessageHandler(MessageHandler handler) = 0;

  /// From now on messages are taken.
  virtual void start() = 0;
};

/// Accepts the peers of one named message service.
class ServiceListener {
 public:
  /// Given each new peer, on the main thread. The peer belongs to the service; a peer that the
  /// handler does not start is turned away.
  using PeerHandler = std::function<void(PeerConnection& peer)>;

  virtual ~ServiceListener() = default;

  /// To be called before `start`; without a handler every peer is turned away.
  virtual void setPeerHandler(PeerHandler handler) = 0;

  /// From now on peers are accepted.
  virtual void start() = 0;
};

/// The platform's services by which processes reach each other.
class MessageService {
 public:
  virtual ~MessageService() = default;

  /// A listener that offers the named service until it is destroyed. Null when it cannot be
  /// created, for instance because another process offers the service; the system log says why.
  virtual std::unique_ptr<ServiceListener> createListener(std::string_view name) = 0;
};

}  // namespace vesprun
