#pragma once

#include <sys/types.h>

#include <optional>
#include <string>
#include <string_view>

#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/FileDescriptor.h"

namespace vesprun {

/// The listening socket of a named service: `run/NAME` in the device directory, for its owner
/// alone. The file is removed at the end, if it is still this socket's.
///
/// The process that offers a service holds the lock of the folder `run` for as long, so that two
/// that start at once cannot take the name from each other, and a file that a killed process left
/// behind is known to be dead. A device therefore has one service at a time.
class ServiceSocket {
 public:
  /// Listens. Nothing, with a text in `error`, when another holder offers a service or the socket
  /// cannot be made.
  static std::optional<ServiceSocket> listen(const DeviceDirectory& directory,
                                             std::string_view name, std::string& error);

  ServiceSocket(ServiceSocket&&) noexcept = default;
  ServiceSocket& operator=(ServiceSocket&&) = delete;
  ~ServiceSocket();

  int descriptor() const { return _socket.get(); }

  /// The next waiting peer, its socket non-blocking. Closed when there is none, when it went away
  /// meanwhile (`error` stays as it is), and when it cannot be accepted (`error` says why).
  FileDescriptor accept(std::string& error) const;

 private:
  ServiceSocket(FileDescriptor folder, FileDescriptor socket, std::string name);

  FileDescriptor _folder;  ///< closing it releases the lock
  FileDescriptor _socket;
  std::string _name;
  dev_t _device = 0;
  ino_t _file = 0;
};

/// Connects to a service of the device; the socket blocks, but no step for longer than
/// `patienceInSeconds`. Closed, with a text in `error`, when nobody offers the service.
FileDescriptor connectToService(const DeviceDirectory& directory, std::string_view name,
                                int patienceInSeconds, std::string& error);

/// True when the other end of a connection is the superuser or runs as the same user as this
/// process.
bool peerIsTrusted(int descriptor);

}  // namespace vesprun
