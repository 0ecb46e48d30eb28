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

constexpr std::size_t kMostPeers = 16;
constexpr std::size_t kReceivedPiece = 64 * 1024;

struct UnixPeer final : PeerConnection {
  explicit UnixPeer(FileDescriptor descriptor) : socket(std::move(descriptor)) {}

  void setMessageHandler(MessageHandler messageHandler) override {
    handler = std::move(messageHandler);
  }
  void start() override { isStarted = true; }

  /// Less worth: first a peer that has sent no whole message, then the one silent longest.
  bool isLessWorth(const UnixPeer& other) const {
    return std::pair(hasSentMessage, lastHeard) < std::pair(other.hasSentMessage, other.lastHeard);
  }

  FileDescriptor socket;
  MessageHandler handler;
  MessageAssembler assembler;
  std::chrono::steady_clock::time_point lastHeard = std::chrono::steady_clock::now();
  bool hasSentMessage = false;
  bool isStarted = false;
};

class UnixServiceListener final : public ServiceListener {
 public:
  UnixServiceListener(ServiceSocket socket, std::string name, SystemLog& log,
                      HostMainLoop& mainLoop)
      : _socket(std::move(socket)), _name(std::move(name)), _log(log), _mainLoop(mainLoop) {}

  ~UnixServiceListener() override {
    _mainLoop.unwatch(_socket.descriptor());
    for (const auto& [descriptor, peer] : _peers) {
      _mainLoop.unwatch(descriptor);
    }
  }

  void setPeerHandler(PeerHandler handler) override { _handler = std::move(handler); }

  void start() override {
    _started = true;
    watchForPeers();
  }

 private:
  using PeerPointer = std::shared_ptr<UnixPeer>;

  /// Drops the work if the listener is gone by then.
  void queueWork(HostMainLoop::Work work) {
    _mainLoop.queueWork([alive = std::weak_ptr<bool>(_alive), work = std::move(work)] {
      if (!alive.expired()) {
        work();
      }
    });
  }

  void watchForPeers() {
    if (_started) {
      _mainLoop.watch(_socket.descriptor(), [this] { acceptPeer(); });
    }
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
    if (_peers.size() == kMostPeers) {
      const auto least =
          std::min_element(_peers.begin(), _peers.end(), [](const auto& left, const auto& right) {
            return left.second->isLessWorth(*right.second);
          });
      drop(*PeerPointer(least->second), "others wait, and it has been silent longest");
    }
    const auto peer = std::make_shared<UnixPeer>(std::move(socket));
    _peers.emplace(peer->socket.get(), peer);
    queueWork([this, peer] { introduce(peer); });
  }

  void introduce(const PeerPointer& peer) {
    if (_handler) {
      _handler(*peer);
    }
    if (peer->isStarted) {
      _mainLoop.watch(peer->socket.get(), [this, peer] { receive(peer); });
    } else {
      drop(*peer, "");
    }
  }

  void receive(const PeerPointer& peer) {
    const ssize_t count = recv(peer->socket.get(), _piece.data(), _piece.size(), MSG_DONTWAIT);
    if (count < 0) {
      if (errno != EAGAIN && errno != EINTR) {
        drop(*peer, std::strerror(errno));
      }
      return;
    }
    peer->lastHeard = std::chrono::steady_clock::now();
    MessageAssembler& assembler = peer->assembler;
    if (count == 0) {
      drop(*peer, assembler.isInsideMessage() ? "it ended in the middle of a message" : "");
      return;
    }
    std::string_view bytes(_piece.data(), static_cast<std::size_t>(count));
    MessageAssembler::Progress progress = assembler.take(bytes);
    for (; progress == MessageAssembler::Progress::Complete; progress = assembler.take(bytes)) {
      std::string error;
      std::optional<PropertyValue> message = readPtree(assembler.takeDocument(), error);
      if (!message) {
        drop(*peer, error);
        return;
      }
      peer->hasSentMessage = true;
      queueWork([peer, message = *std::move(message)] {
        if (peer->handler) {
          peer->handler(message);
        }
      });
    }
    if (progress == MessageAssembler::Progress::TooLong) {
      drop(*peer, "a message is longer than " + std::to_string(kLongestMessage) + " bytes");
    }
  }

  void drop(const UnixPeer& peer, std::string_view why) {
    if (!why.empty()) {
      tell("a peer is dropped: " + std::string(why));
    }
    const int descriptor = peer.socket.get();
    // Queued messages may keep the object for a while; end the connection now.
    shutdown(descriptor, SHUT_RDWR);
    _mainLoop.unwatch(descriptor);
    _peers.erase(descriptor);
    watchForPeers();
  }

  void tell(const std::string& what) { _log.write(LogLevel::Error, _name + ": " + what); }

  ServiceSocket _socket;
  std::string _name;
  SystemLog& _log;
  HostMainLoop& _mainLoop;
  PeerHandler _handler;
  bool _started = false;
  std::map<int, PeerPointer> _peers;
  std::array<char, kReceivedPiece> _piece{};
  std::shared_ptr<bool> _alive = std::make_shared<bool>(true);
};

}  // namespace

std::unique_ptr<ServiceListener> HostMessageService::createListener(std::string_view name) {
  std::string error;
  std::optional<ServiceSocket> socket = ServiceSocket::listen(_directory, name, error);
  if (!socket) {
    _log.write(LogLevel::Error, error);
    return nullptr;
  }
  return std::make_unique<UnixServiceListener>(*std::move(socket), std::string(name), _log,
                                               _mainLoop);
}

}  // namespace vesprun
