#pragma once

#include <functional>
#include <memory>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The event loop of the main thread.
class MainLoop {
 public:
  enum class SliceResult { HandledEvent, TimedOut };

  virtual ~MainLoop() = default;

  /// Waits for one event (a delivered message), `seconds` at most.
  virtual SliceResult runMainLoopSlice(double seconds) = 0;
};

/// A peer of a named message service. Messages arrive on the main thread while the main loop runs.
class PeerConnection {
 public:
  /// Called with each message, which may be any type of value.
  using MessageHandler = std::function<void(const PropertyValue& message)>;

  virtual ~PeerConnection() = default;

  /// Call before `start`; a message without a handler is dropped.
  virtual void setMessageHandler(MessageHandler handler) = 0;

  /// From now on messages are taken.
  virtual void start() = 0;
};

/// Accepts the peers of one named message service.
class ServiceListener {
 public:
  /// Called with each new peer, on the main thread. The service owns the peer, and turns it away
  /// unless the handler starts it.
  using PeerHandler = std::function<void(PeerConnection& peer)>;

  virtual ~ServiceListener() = default;

  /// Call before `start`; without a handler every peer is turned away.
  virtual void setPeerHandler(PeerHandler handler) = 0;

  /// From now on peers are accepted.
  virtual void start() = 0;
};

/// Messages between processes.
class MessageService {
 public:
  virtual ~MessageService() = default;

  /// Offers the named service until the listener is destroyed. Null, with the reason in the system
  /// log, when that fails, for instance because another process offers it.
  virtual std::unique_ptr<ServiceListener> createListener(std::string_view name) = 0;
};

}  // namespace vesprun
