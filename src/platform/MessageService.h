#pragma once

#include <functional>
#include <memory>
#include <string_view>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// The event loop of the main thread.
class MainLoop {
 public:
  enum class SliceResult { HandledEvent, TimedOut };

  virtual ~MainLoop() = default;

  /// Waits for one event (a delivered message), `seconds` at most.
  virtual SliceResult runMainLoopSlice(double seconds) = 0;
};

/// A named message service, offered until the object is destroyed.
class ServiceListener {
 public:
  virtual ~ServiceListener() = default;
};

/// Messages between processes.
class MessageService {
 public:
  /// Called with each message of any peer, on the main thread while the main loop runs. A message
  /// may be any type of value.
  using MessageHandler = std::function<void(const PropertyValue& message)>;

  virtual ~MessageService() = default;

  /// Offers the named service. Null, with the reason in the system log, when that fails, for
  /// instance because another process offers it.
  virtual std::unique_ptr<ServiceListener> createListener(std::string_view name,
                                                          MessageHandler handler) = 0;
};

}  // namespace vesprun
