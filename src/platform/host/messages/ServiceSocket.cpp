#include "platform/host/messages/ServiceSocket.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <utility>

namespace vesprun {
namespace {

constexpr const char* kFolder = "run";
constexpr int kWaitingPeers = 16;
constexpr mode_t kSocketMode = 0600;

/// A path too long for an address goes through the open folder.
std::optional<sockaddr_un> addressOf(const std::string& path, int folder, const std::string& name) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  const std::string usable = path.size() < sizeof address.sun_path
                                 ? path
                                 : "/proc/self/fd/" + std::to_string(folder) + '/' + name;
  if (usable.size() >= sizeof address.sun_path) {
    errno = ENAMETOOLONG;
    return std::nullopt;
  }
  usable.copy(address.sun_path, usable.size());
  return address;
}

const sockaddr* generic(const sockaddr_un& address) {
  return reinterpret_cast<const sockaddr*>(&address);
}

/// Removes the socket of that name, if any. Call with the folder's lock: then nobody uses it.
bool removeSocket(int folder, const std::string& name) {
  struct stat status {};
  if (fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
    return errno == ENOENT;
  }
  // Leave anything else alone; binding then fails.
  return !S_ISSOCK(status.st_mode) || unlinkat(folder, name.c_str(), 0) == 0;
}

}  // namespace

ServiceSocket::ServiceSocket(FileDescriptor folder, FileDescriptor socket, std::string name)
    : _folder(std::move(folder)), _socket(std::move(socket)), _name(std::move(name)) {}

std::optional<ServiceSocket> ServiceSocket::listen(const DeviceDirectory& directory,
                                                   std::string_view name, std::string& error) {
  const std::optional<HostPath> folderPath = directory.makeFolder(kFolder, error);
  if (!folderPath) {
    return std::nullopt;
  }
  const std::string path = folderPath->below(name);
  ServiceSocket service(
      openFolder(*folderPath),
      FileDescriptor(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0)),
      std::string(name));
  const int folder = service._folder.get();
  const int socket = service._socket.get();
  if (folder < 0 || socket < 0) {
    error = systemError(folder < 0 ? folderPath->string() : path);
    return std::nullopt;
  }
  if (flock(folder, LOCK_EX | LOCK_NB) != 0) {
    error =
        errno == EWOULDBLOCK ? path + ": another process offers the service" : systemError(path);
    return std::nullopt;
  }
  const std::optional<sockaddr_un> address = addressOf(path, folder, service._name);
  // Nobody can connect before the socket listens; by then only its owner may.
  service._isBound = address && removeSocket(folder, service._name) &&
                     bind(socket, generic(*address), sizeof *address) == 0;
  if (!service._isBound || fchmodat(folder, service._name.c_str(), kSocketMode, 0) != 0 ||
      ::listen(socket, kWaitingPeers) != 0) {
    error = systemError(path);
    return std::nullopt;
  }
  return service;
}

ServiceSocket::~ServiceSocket() {
  if (_folder.isOpen() && _isBound) {
    removeSocket(_folder.get(), _name);
  }
}

FileDescriptor ServiceSocket::accept(std::string& error) const {
  FileDescriptor peer(accept4(_socket.get(), nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK));
  if (!peer.isOpen() && errno != EAGAIN && errno != EINTR && errno != ECONNABORTED) {
    error = std::strerror(errno);
  }
  return peer;
}

FileDescriptor connectToService(const DeviceDirectory& directory, std::string_view name,
                                int patienceInSeconds, std::string& error) {
  const HostPath folderPath = directory.hostPath(kFolder);
  const std::string path = folderPath.below(name);
  const FileDescriptor folder = openFolder(folderPath);
  FileDescriptor socket(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
  const timeval patience{patienceInSeconds, 0};
  std::optional<sockaddr_un> address;
  if (socket.isOpen() &&
      setsockopt(socket.get(), SOL_SOCKET, SO_SNDTIMEO, &patience, sizeof patience) == 0 &&
      setsockopt(socket.get(), SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience) == 0) {
    address = addressOf(path, folder.get(), std::string(name));
  }
  if (address && connect(socket.get(), generic(*address), sizeof *address) == 0) {
    return socket;
  }
  error = errno == ENOENT || errno == ECONNREFUSED
              ? path + ": nobody offers the service: start vesprun first"
          : errno == EAGAIN ? path + ": the service is too busy"
                            : systemError(path);
  return {};
}

bool peerIsTrusted(int descriptor) {
  ucred peer{};
  socklen_t size = sizeof peer;
  return getsockopt(descriptor, SOL_SOCKET, SO_PEERCRED, &peer, &size) == 0 &&
         (peer.uid == 0 || peer.uid == geteuid());
}

}  // namespace vesprun
