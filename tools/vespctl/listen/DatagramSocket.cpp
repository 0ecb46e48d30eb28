#include "listen/DatagramSocket.h"

#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "platform/host/documents/NumberText.h"

namespace vesprun {
namespace {

constexpr int kFirstHandedOver = 3;
constexpr mode_t kAnyoneSends = 0666;
constexpr std::size_t kDatagramsAtOnce = 32;

bool isUnixDatagram(int descriptor) {
  int domain = 0;
  int type = 0;
  socklen_t size = sizeof domain;
  return getsockopt(descriptor, SOL_SOCKET, SO_DOMAIN, &domain, &size) == 0 && domain == AF_UNIX &&
         getsockopt(descriptor, SOL_SOCKET, SO_TYPE, &type, &size) == 0 && type == SOCK_DGRAM;
}

bool askForSenders(int descriptor) {
  const int yes = 1;
  return setsockopt(descriptor, SOL_SOCKET, SO_PASSCRED, &yes, sizeof yes) == 0;
}

/// Through the open folder: a long path fits, and no link on the way is followed twice.
sockaddr_un addressIn(int folder, const std::string& name, bool& fits) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  const std::string path = "/proc/self/fd/" + std::to_string(folder) + '/' + name;
  fits = path.size() < sizeof address.sun_path;
  path.copy(address.sun_path, sizeof address.sun_path - 1);
  return address;
}

bool isAbandoned(const sockaddr_un& address) {
  const FileDescriptor probe(socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0));
  return probe.isOpen() &&
         connect(probe.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 &&
         errno == ECONNREFUSED;
}

}  // namespace

std::unique_ptr<DatagramSocket> DatagramSocket::activated(std::string& error) {
  const char* const process = std::getenv("LISTEN_PID");
  const char* const count = std::getenv("LISTEN_FDS");
  pid_t forProcess = 0;
  int descriptors = 0;
  if (process == nullptr || count == nullptr || !parseWholeText(process, forProcess) ||
      forProcess != getpid() || !parseWholeText(count, descriptors) || descriptors < 1) {
    return nullptr;
  }
  FileDescriptor socket(kFirstHandedOver);
  if (descriptors > 1 || !isUnixDatagram(socket.get()) || !askForSenders(socket.get()) ||
      fcntl(socket.get(), F_SETFD, FD_CLOEXEC) != 0) {
    error = "what was handed over is not one Unix datagram socket";
    return nullptr;
  }
  return std::unique_ptr<DatagramSocket>(
      new DatagramSocket(std::move(socket), FileDescriptor(), {}));
}

std::unique_ptr<DatagramSocket> DatagramSocket::bind(const HostPath& path, std::string& error) {
  const std::string name = path.name();
  FileDescriptor folder = openFolder(path.folder());
  FileDescriptor socket(::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0));
  if (!folder.isOpen() || !socket.isOpen()) {
    error = systemError(path);
    return nullptr;
  }
  // Two that start at once must not both find the old socket abandoned.
  if (!takeLock(folder.get(), LOCK_EX, kMaxLockWait, path.folder(), error)) {
    return nullptr;
  }
  bool fits = false;
  const sockaddr_un address = addressIn(folder.get(), name, fits);
  struct stat status {};
  if (name.empty() || !fits) {
    error = path.string() + ": not the name of a socket";
    return nullptr;
  }
  if (fstatat(folder.get(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0) {
    if (!S_ISSOCK(status.st_mode)) {
      error = path.string() + ": something else than a socket is there";
      return nullptr;
    }
    if (!isAbandoned(address)) {
      error = path.string() + ": another process listens there";
      return nullptr;
    }
    unlinkat(folder.get(), name.c_str(), 0);
  }
  // Some may send as soon as it is there; a default access control list ignores the umask.
  const mode_t mask = umask(ACCESSPERMS & ~kAnyoneSends);
  const bool done =
      askForSenders(socket.get()) &&
      ::bind(socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0 &&
      fchmodat(folder.get(), name.c_str(), kAnyoneSends, 0) == 0;
  umask(mask);
  if (!done) {
    error = systemError(path);
    return nullptr;
  }
  flock(folder.get(), LOCK_UN);
  return std::unique_ptr<DatagramSocket>(
      new DatagramSocket(std::move(socket), std::move(folder), name));
}

DatagramSocket::~DatagramSocket() { close(); }

void DatagramSocket::close() {
  if (_folder.isOpen() && !_name.empty()) {
    unlinkat(_folder.get(), _name.c_str(), 0);
    _name.clear();
  }
}

bool DatagramSocket::receive(const Receiver& receiver) const {
  struct Slot {
    std::array<char, kMaxDatagram> text;
    alignas(cmsghdr) std::array<char, CMSG_SPACE(sizeof(ucred))> control;
    iovec vector;
  };
  static std::vector<Slot> slots(kDatagramsAtOnce);  // one thread receives
  static std::array<mmsghdr, kDatagramsAtOnce> messages;
  for (std::size_t i = 0; i < kDatagramsAtOnce; ++i) {
    slots[i].vector = {slots[i].text.data(), slots[i].text.size()};
    messages[i] = {};
    messages[i].msg_hdr.msg_iov = &slots[i].vector;
    messages[i].msg_hdr.msg_iovlen = 1;
    messages[i].msg_hdr.msg_control = slots[i].control.data();
    messages[i].msg_hdr.msg_controllen = slots[i].control.size();
  }
  const int count = recvmmsg(_socket.get(), messages.data(), kDatagramsAtOnce,
                             MSG_DONTWAIT | MSG_CMSG_CLOEXEC, nullptr);
  for (int i = 0; i < count; ++i) {
    mmsghdr& message = messages[static_cast<std::size_t>(i)];
    std::optional<uid_t> sender;
    for (cmsghdr* part = CMSG_FIRSTHDR(&message.msg_hdr); part != nullptr;
         part = CMSG_NXTHDR(&message.msg_hdr, part)) {
      ucred credentials{};
      if (part->cmsg_level == SOL_SOCKET && part->cmsg_type == SCM_CREDENTIALS) {
        std::memcpy(&credentials, CMSG_DATA(part), sizeof credentials);
        // What was sent before the socket asked for senders comes from process 0, nobody.
        constexpr uid_t kOverflow = 65534;
        if (credentials.pid != 0 || credentials.uid != kOverflow) {
          sender = credentials.uid;
        }
      }
    }
    const bool isCut = (message.msg_hdr.msg_flags & MSG_TRUNC) != 0;
    receiver(sender, isCut ? std::nullopt
                           : std::optional(std::string_view(
                                 slots[static_cast<std::size_t>(i)].text.data(), message.msg_len)));
  }
  return count > 0;
}

}  // namespace vesprun
