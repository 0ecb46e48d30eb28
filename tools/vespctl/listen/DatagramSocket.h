#pragma once

#include <sys/types.h>

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "platform/host/files/Files.h"

namespace vesprun {

/// A Unix datagram socket that every local user may send to, and that hears from the kernel who
/// did.
class DatagramSocket {
 public:
  static constexpr std::size_t kMaxDatagram = 8'192;

  /// The socket that the system's socket activation hands over. Nothing without one, and with a
  /// text in `error` when something else than a Unix datagram socket was handed over.
  static std::unique_ptr<DatagramSocket> activated(std::string& error);

  /// A new socket at `path`, removed at the end. A socket there that nobody listens on is replaced;
  /// anything else stays: null then, with a text in `error`.
  static std::unique_ptr<DatagramSocket> bind(const HostPath& path, std::string& error);

  ~DatagramSocket();
  DatagramSocket(const DatagramSocket&) = delete;
  DatagramSocket& operator=(const DatagramSocket&) = delete;

  int descriptor() const { return _socket.get(); }

  /// Removes a socket of our own, so that nobody sends to it any more.
  void close();

  /// No user where the kernel does not say who sent it; no text where it is longer than
  /// `kMaxDatagram`.
  using Receiver =
      std::function<void(std::optional<uid_t> sender, std::optional<std::string_view> datagram)>;

  /// Delivers what waits, at most some datagrams. False when none waited.
  bool receive(const Receiver& receiver) const;

 private:
  DatagramSocket(FileDescriptor socket, FileDescriptor folder, std::string name)
      : _socket(std::move(socket)), _folder(std::move(folder)), _name(std::move(name)) {}

  FileDescriptor _socket;
  FileDescriptor _folder;
  std::string _name;  ///< empty when it is not ours to remove
};

}  // namespace vesprun
