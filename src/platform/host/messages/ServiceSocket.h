#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/Files.h"

namespace vesprun {

/// The listening socket of a named service, `run/NAME`, for its owner alone; removed at the end.
/// The process holds the lock of the folder `run`: two cannot take the name from each other, a file
/// without a holder is left from a kill, and a device has one service at a time.
class ServiceSocket {
 public:
  /// Nothing, with a text in `error`, when another process offers a service or the socket fails.
  static std::optional<ServiceSocket> listen(const DeviceDirectory& directory,
                                             std::string_view name, std::string& error);

  ServiceSocket(ServiceSocket&&) noexcept = default;
  ServiceSocket& operator=(ServiceSocket&&) = delete;
  ~ServiceSocket();

  int descriptor() const { return _socket.get(); }

  /// The next waiting peer, non-blocking. Closed when none waits (or it has gone), and with a text
  /// in `error` when it cannot be accepted.
  FileDescriptor accept(std::string& error) const;

 private:
  ServiceSocket(FileDescriptor folder, FileDescriptor socket, std::string name);

  FileDescriptor _folder;  ///< closing it releases the lock
  FileDescriptor _socket;
  std::string _name;
  bool _isBound = false;
};

/// Connects to a service of the device; the socket blocks, `patienceInSeconds` at most in each
/// step. Closed, with a text in `error`, when nobody offers the service.
FileDescriptor connectToService(const DeviceDirectory& directory, std::string_view name,
                                int patienceInSeconds, std::string& error);

/// True when the other end runs as this process's user or as root.
bool peerIsTrusted(int descriptor);

}  // namespace vesprun
