#pragma once

#include "platform/MessageService.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/messages/HostMainLoop.h"

namespace vesprun {

/// Named message services over Unix stream sockets, `run/NAME` in the device directory. A message
/// is a 32-bit little-endian length and a ptree document of that many bytes; nothing is sent back.
///
/// A new peer is an event of the main loop, and so is each message. A peer of another user (except
/// root), one that sends anything else and one that ends inside a message is disconnected, with the
/// reason in the system log. With 16 peers, a further one takes the place of the one silent
/// longest, of those without a whole message first. A message is delivered even if its peer is
/// gone.
///
/// Listeners must not outlive the references, nor be destroyed by their handler.
class HostMessageService final : public MessageService {
 public:
  HostMessageService(const DeviceDirectory& directory, SystemLog& log, HostMainLoop& mainLoop)
      : _directory(directory), _log(log), _mainLoop(mainLoop) {}

  /// One at a time for a device: see `ServiceSocket`.
  std::unique_ptr<ServiceListener> createListener(std::string_view name,
                                                  MessageHandler handler) override;

 private:
  const DeviceDirectory& _directory;
  SystemLog& _log;
  HostMainLoop& _mainLoop;
};

}  // namespace vesprun
