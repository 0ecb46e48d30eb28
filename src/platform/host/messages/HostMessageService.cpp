#include "platform/host/messages/HostMessageService.h"

#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <map>
#include <utility>

#include "platform/host/documents/PtreeReader.h"
#include "platform/host/messages/MessageFraming.h"
#include "platform/host/messages/ServiceSocket.h"

namespace vesprun {
namespace {

constexpr std::size_t kMaxPeers = 16;
constexpr std::size_t kReceivedPiece = 64 * 1024;

struct UnixPeer {
  /// The least is displaced first: a peer without a whole message, then the one silent longest.
  auto worth() const { return std::pair(hasSentMessage, lastHeard); }

  FileDescriptor socket;
  MessageAssembler assembler{};
  std::chrono::steady_clock::time_point lastHeard = std::chrono::steady_clock::now();
  bool hasSentMessage = false;
};

class UnixServiceListener final : public ServiceListener {
 public:
  UnixServiceListener(ServiceSocket socket, std::string name,
                      MessageService::MessageHandler handler, SystemLog& log,
                      HostMainLoop& mainLoop)
      : _socket(std::move(socket)),
        _name(std::move(name)),
        _handler(std::move(handler)),
        _log(log),
        _mainLoop(mainLoop) {
    watchForPeers();
  }

  ~UnixServiceListener() override {
    _mainLoop.unwatch(_socket.descriptor());
    for (const auto& [descriptor, peer] : _peers) {
      _mainLoop.unwatch(descriptor);
    }
  }

 private:
  /// Drops the work if the listener is gone by then.
  void queueWork(HostMainLoop::Work work) {
    _mainLoop.queueWork([alive = std::weak_ptr<bool>(_alive), work = std::move(work)] {
      if (!alive.expired()) {
        work();
      }
    });
  }

  void watchForPeers() {
    _mainLoop.watch(_socket.descriptor(), [this] { acceptPeer(); });
  }

  void acceptPeer() {
    std::string error;
    FileDescriptor socket = _socket.accept(error);
    if (!error.empty()) {
      tell("no peer can be accepted: " + error);
      // It would fail again at once, until another peer goes.
      _mainLoop.unwatch(_socket.descriptor());
    }
    if (!socket.isOpen()) {
      return;
    }
    if (!peerIsTrusted(socket.get())) {
      tell("a peer of another user is turned away");
      return;
    }
    if (_peers.size() == kMaxPeers) {
      const auto least = std::ranges::min_element(
          _peers, {}, [](const auto& peer) { return peer.second.worth(); });
      drop(least->first, "others wait, and it has been silent longest");
    }
    const int descriptor = socket.get();
    _peers.emplace(descriptor, UnixPeer{std::move(socket)});
    queueWork([this, descriptor] {
      if (_peers.contains(descriptor)) {
        _mainLoop.watch(descriptor, [this, descriptor] { receive(descriptor); });
      }
    });
  }

  void receive(int descriptor) {
    const ssize_t count = recv(descriptor, _piece.data(), _piece.size(), MSG_DONTWAIT);
    if (count < 0) {
      if (errno != EAGAIN && errno != EINTR) {
        drop(descriptor, std::strerror(errno));
      }
      return;
    }
    UnixPeer& peer = _peers.at(descriptor);
    peer.lastHeard = std::chrono::steady_clock::now();
    MessageAssembler& assembler = peer.assembler;
    if (count == 0) {
      drop(descriptor, assembler.isInsideMessage() ? "it ended in the middle of a message" : "");
      return;
    }
    std::string_view bytes(_piece.data(), static_cast<std::size_t>(count));
    MessageAssembler::Progress progress = assembler.take(bytes);
    for (; progress == MessageAssembler::Progress::Complete; progress = assembler.take(bytes)) {
      std::string error;
      std::optional<PropertyValue> message = readPtree(assembler.takeDocument(), error);
      if (!message) {
        drop(descriptor, error);
        return;
      }
      peer.hasSentMessage = true;
      queueWork([this, message = *std::move(message)] { _handler(message); });
    }
    if (progress == MessageAssembler::Progress::TooLong) {
      drop(descriptor, "a message is longer than " + std::to_string(kMaxMessageSize) + " bytes");
    }
  }

  void drop(int descriptor, std::string_view why) {
    if (!why.empty()) {
      tell("a peer is dropped: " + std::string(why));
    }
    _mainLoop.unwatch(descriptor);
    _peers.erase(descriptor);
    watchForPeers();
  }

  void tell(const std::string& what) { _log.write(LogLevel::Error, _name + ": " + what); }

  ServiceSocket _socket;
  std::string _name;
  MessageService::MessageHandler _handler;
  SystemLog& _log;
  HostMainLoop& _mainLoop;
  std::map<int, UnixPeer> _peers;  ///< by descriptor
  std::array<char, kReceivedPiece> _piece{};
  std::shared_ptr<bool> _alive = std::make_shared<bool>(true);
};

}  // namespace

std::unique_ptr<ServiceListener> HostMessageService::createListener(std::string_view name,
                                                                    MessageHandler handler) {
  std::string error;
  std::optional<ServiceSocket> socket = ServiceSocket::listen(_directory, name, error);
  if (!socket) {
    _log.write(LogLevel::Error, error);
    return nullptr;
  }
  return std::make_unique<UnixServiceListener>(*std::move(socket), std::string(name),
                                               std::move(handler), _log, _mainLoop);
}

}  // namespace vesprun
