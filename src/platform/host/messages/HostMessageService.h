#pragma once

#include "platform/MessageService.h"
#include "platform/PtreeSerialization.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/messages/HostMainLoop.h"

namespace vesprun {

/// Named message services over Unix stream sockets, `run/NAME` in the device directory. A message
/// is a 32-bit little-endian length and that many bytes of a ptree document; nothing is ever sent
/// back.
///
/// A new peer is one event of the main loop, and so is each message. A peer that is another user
/// (unless that is root), sends what is no message, or ends in the middle of one loses its
/// connection, and the system log says why. At most 16 peers are served at a time; one more takes
/// the place of one that has sent no whole message, or else of any: the one that has been silent
/// longest. A message that arrived whole is delivered
/// even if its peer is gone by then.
///
/// All references must outlive the listeners, and a listener must not be destroyed by one of its
/// own handlers.
class HostMessageService final : public MessageService {
 public:
  HostMessageService(const DeviceDirectory& directory, PtreeSerialization& serialization,
                     SystemLog& log, HostMainLoop& mainLoop)
      : _directory(directory), _serialization(serialization), _log(log), _mainLoop(mainLoop) {}

  /// A device has one service at a time: see `ServiceSocket`.
  std::unique_ptr<ServiceListener> createListener(std::string_view name) override;

 private:
  const DeviceDirectory& _directory;
  PtreeSerialization& _serialization;
  SystemLog& _log;
  HostMainLoop& _mainLoop;
};

}  // namespace vesprun
