#include "interface/CounterSocket.h"

#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/un.h>

#include <array>
#include <charconv>
#include <cmath>

#include "platform/host/counters/CounterStore.h"
#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

constexpr std::size_t kMaxDatagram = 8'192;
/// A listener that is stopped must not stop its senders for good.
constexpr timeval kMaxWait{5, 0};

}  // namespace

bool CounterSocket::isSocket(const std::string& path) {
  struct stat status {};
  return stat(path.c_str(), &status) == 0 && S_ISSOCK(status.st_mode);
}

std::unique_ptr<CounterSocket> CounterSocket::open(const std::string& path, CallFailure& failure) {
  std::unique_ptr<CounterSocket> opened(new CounterSocket(path));
  return opened->connect(failure) ? std::move(opened) : nullptr;
}

bool CounterSocket::setScalar(std::string_view key, std::int64_t value, CallFailure& failure) {
  return append(key, value, 'g', failure);
}

bool CounterSocket::addToScalar(std::string_view key, std::int64_t value, CallFailure& failure) {
  return append(key, value, 'c', failure);
}

bool CounterSocket::addToDistribution(std::string_view key, double value, CallFailure& failure) {
  return std::isfinite(value)
             ? append(key, value, 'd', failure)
             : failure.set(VESPRUN_ERROR_ARGUMENT, "the socket carries finite values only");
}

bool CounterSocket::flush(CallFailure& failure) {
  const std::scoped_lock guard(_mutex);
  return sendCollected(failure);
}

template <typename T>
bool CounterSocket::append(std::string_view key, T value, char type, CallFailure& failure) {
  std::array<char, 32> digits;
  const char* const end = std::to_chars(digits.begin(), digits.end(), value).ptr;
  const std::string_view number(digits.data(), static_cast<std::size_t>(end - digits.data()));
  const std::size_t length = key.size() + number.size() + 4;  // ":", "|", the type, a line feed
  if (key.empty() || key.find_first_of(":|\n") != std::string_view::npos || length > kMaxDatagram) {
    return failure.set(VESPRUN_ERROR_KEY,
                       "a key that the socket cannot carry: empty, too long, or with \":\", \"|\" "
                       "or a line feed");
  }
  if (!isCounterKey(key, failure.text)) {
    failure.code = VESPRUN_ERROR_KEY;
    return false;
  }
  const std::scoped_lock guard(_mutex);
  if (_lines.size() + length > kMaxDatagram && !sendCollected(failure)) {
    return false;
  }
  _lines.reserve(kMaxDatagram);
  _lines.append(key).append(1, ':').append(number).append({'|', type, '\n'});
  return true;
}

bool CounterSocket::connect(CallFailure& failure) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (_path.size() >= sizeof address.sun_path) {
    return failure.set(VESPRUN_ERROR_ARGUMENT, _path + ": too long for the path of a socket");
  }
  _path.copy(address.sun_path, _path.size());
  FileDescriptor socket(::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0));
  if (!socket.isOpen() ||
      setsockopt(socket.get(), SOL_SOCKET, SO_SNDTIMEO, &kMaxWait, sizeof kMaxWait) != 0 ||
      ::connect(socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
    return failed(failure);
  }
  _socket = std::move(socket);
  return true;
}

bool CounterSocket::sendCollected(CallFailure& failure) {
  const auto send = [this] {
    return _lines.empty() || ::send(_socket.get(), _lines.data(), _lines.size(), 0) >= 0;
  };
  if (!send()) {
    // A listener that was started anew has another socket.
    const bool isGone = errno == ECONNREFUSED || errno == ENOTCONN || errno == ECONNRESET;
    if (!isGone) {
      return failed(failure);
    }
    if (!connect(failure)) {
      return false;
    }
    if (!send()) {
      return failed(failure);
    }
  }
  _lines.clear();
  return true;
}

/// False, with the reason that `errno` has.
bool CounterSocket::failed(CallFailure& failure) const {
  const bool isFull = errno == EAGAIN;  // for `kMaxWait`
  const bool isNone = errno == ECONNREFUSED || errno == ENOENT || errno == EPROTOTYPE;
  return failure.set(isFull   ? VESPRUN_ERROR_BUSY
                     : isNone ? VESPRUN_ERROR_NOT_A_DEVICE
                              : VESPRUN_ERROR_OTHER,
                     systemError(_path));
}

}  // namespace vesprun
