#include "listen/ListenCommand.h"

#include <poll.h>
#include <sys/signalfd.h>

#include <array>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <csignal>
#include <mutex>
#include <thread>

#include "access/CommandDevice.h"
#include "listen/DatagramSocket.h"
#include "listen/Senders.h"
#include "listen/StatsdLine.h"
#include "platform/Guarded.h"
#include "platform/host/counters/HostTallybook.h"

namespace vesprun {
namespace {

using SteadyClock = std::chrono::steady_clock;

constexpr std::chrono::seconds kCheckpointDelay(5);
constexpr std::chrono::seconds kMaxIdle(60);
constexpr std::chrono::seconds kMaxDrain(5);
constexpr std::chrono::minutes kReportInterval(1);
/// That many changes wait in memory at most.
constexpr std::size_t kMaxWaiting = 100'000;

struct Reason {
  const char* key;
  const char* text;
};
constexpr std::array<Reason, 4> kReasons = {{
    {"vesprun.listen.dropped.form", "it is malformed"},
    {"vesprun.listen.dropped.kind", "sets and tags are not counted"},
    {"vesprun.listen.dropped.rights", "the user may not count this key"},
    {"vesprun.listen.dropped.bounds", "the day's bounds are reached"},
}};

/// Writes changes in a thread of its own: senders need not wait for another writer's lock.
class Checkpoints {
 public:
  Checkpoints(HostPlatform& device, Senders& senders)
      : _device(device), _senders(senders), _thread([this] { run(); }) {}

  ~Checkpoints() {
    {
      const std::scoped_lock guard(_mutex);
      _ends = true;
    }
    _wake.notify_one();
    _thread.join();
  }
  Checkpoints(const Checkpoints&) = delete;
  Checkpoints& operator=(const Checkpoints&) = delete;

  /// Something waits to be written, within seconds.
  void changed() {
    if (!_isDirty.exchange(true)) {
      const std::scoped_lock guard(_mutex);
      _wake.notify_one();
    }
  }

  /// Writes all changes now. On failure they wait for the next time.
  bool write() {
    const std::scoped_lock guard(_writing);
    _isDirty = false;
    std::string error;
    // The keys first: what was counted is never forgotten by the bounds.
    const bool done = _senders.noteKeys(error) && _device.counters().checkpoint(error);
    if (!done) {
      _isDirty = true;
      _device.systemLog().write(LogLevel::Error, "listen: counters wait: " + error);
    }
    return done;
  }

 private:
  void run() {
    std::unique_lock lock(_mutex);
    while (!_ends) {
      _wake.wait(lock, [this] { return _isDirty || _ends; });
      _wake.wait_for(lock, kCheckpointDelay, [this] { return _ends; });
      if (!_ends) {
        lock.unlock();
        runGuarded(_device.systemLog(), "listen", [this] { write(); });
        lock.lock();
      }
    }
  }

  HostPlatform& _device;
  Senders& _senders;
  std::mutex _writing;
  std::mutex _mutex;
  std::condition_variable _wake;
  std::atomic<bool> _isDirty = false;
  bool _ends = false;
  std::thread _thread;  // last: it uses all of the above
};

class Listener {
 public:
  explicit Listener(HostPlatform& device) : _device(device), _senders(device) {}

  void take(std::optional<uid_t> sender, std::optional<std::string_view> datagram) {
    const std::int32_t today = _device.tallybook().TBDaysSince1970();
    if (today != _day) {
      if (_day) {
        write();  // a day that begins again counts what was written
      }
      _senders.beginDay(today);
      _day = today;
    }
    if (!datagram) {
      drop(DropReason::Form, sender);
    }
    for (std::string_view rest = datagram.value_or(""); !rest.empty();) {
      const std::size_t end = rest.find('\n');
      const std::string_view line = rest.substr(0, end);
      rest.remove_prefix(end == std::string_view::npos ? rest.size() : end + 1);
      if (!line.empty()) {
        takeLine(sender, line);
      }
    }
    _checkpoints.changed();
  }

  bool write() {
    const bool done = _checkpoints.write();
    _waiting = done ? 0 : _waiting;
    return done;
  }

 private:
  /// Also writes, where much waits. False, with more than that, on a full disk, say: what cannot be
  /// kept is not taken.
  bool hasRoom() {
    const SteadyClock::time_point now = SteadyClock::now();
    if (_waiting >= kMaxWaiting && _nextTry <= now && !write()) {
      _nextTry = now + kCheckpointDelay;
    }
    return _waiting < kMaxWaiting;
  }

  void takeLine(std::optional<uid_t> sender, std::string_view line) {
    std::optional<DropReason> reason = parseStatsdLine(line, _line);
    if (reason != DropReason::Form && !isCounterKey(_line.key, _error)) {
      reason = DropReason::Form;
    }
    if (!reason) {
      reason = hasRoom() ? _senders.admit(sender, _line) : DropReason::Bounds;
    }
    if (reason) {
      drop(*reason, sender);
      return;
    }
    HostTallybook& counters = _device.counters();
    for (const std::int64_t value : _line.integers) {
      _line.change == StatsdLine::Change::Add ? counters.addToScalar(_line.key, value, _error)
                                              : counters.setScalar(_line.key, value, _error);
    }
    for (const double value : _line.numbers) {
      counters.addSample(_line.key, value, _error);
    }
    _waiting += 1 + _line.numbers.size();
  }

  void drop(DropReason reason, std::optional<uid_t> sender) {
    const auto index = static_cast<std::size_t>(reason);
    _device.counters().addToScalar(kReasons[index].key, 1, _error);
    const SteadyClock::time_point now = SteadyClock::now();
    if (_nextReports[index] <= now) {
      _nextReports[index] = now + kReportInterval;
      _device.systemLog().write(LogLevel::Default,
                                "listen: a line of " +
                                    (sender ? nameOfUser(*sender) : "an unknown user") +
                                    " is dropped: " + kReasons[index].text);
    }
  }

  HostPlatform& _device;
  Senders _senders;
  Checkpoints _checkpoints{_device, _senders};
  std::optional<std::int32_t> _day;
  StatsdLine _line;
  std::string _error;
  std::size_t _waiting = 0;  ///< changes since the last checkpoint that was waited for
  SteadyClock::time_point _nextTry{};
  std::array<SteadyClock::time_point, kReasons.size()> _nextReports{};
};

/// SIGTERM and SIGINT as a descriptor that can be waited for.
FileDescriptor endingSignals() {
  sigset_t signals;
  sigemptyset(&signals);
  sigaddset(&signals, SIGTERM);
  sigaddset(&signals, SIGINT);
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);  // before threads begin
  return FileDescriptor(signalfd(-1, &signals, SFD_CLOEXEC | SFD_NONBLOCK));
}

void listen(const std::optional<std::string>& path) {
  const FileDescriptor signals = endingSignals();
  std::string error;
  std::unique_ptr<DatagramSocket> socket = DatagramSocket::activated(error);
  const bool isActivated = socket != nullptr;
  if (!error.empty() || !signals.isOpen()) {
    throw CommandFailure(error.empty() ? systemError("signals") : error);
  }
  if (!socket && path) {
    socket = DatagramSocket::bind(*path, error);  // with the caller's rights
    if (!socket) {
      throw CommandFailure(error);
    }
  }
  const auto device = openDevice();
  if (!socket) {
    socket = orFail([&](std::string& problem) {
      const auto folder = device->directory().makeFolder("run", problem);
      return folder ? DatagramSocket::bind(folder->below("counters"), problem) : nullptr;
    });
  }
  Listener listener(*device);
  const auto take = [&listener](std::optional<uid_t> sender,
                                std::optional<std::string_view> datagram) {
    listener.take(sender, datagram);
  };
  bool ends = false;
  while (!ends) {
    std::array<pollfd, 2> ready = {{{socket->descriptor(), POLLIN, 0}, {signals.get(), POLLIN, 0}}};
    const int idle =
        isActivated ? static_cast<int>(std::chrono::milliseconds(kMaxIdle).count()) : -1;
    const int count = poll(ready.data(), ready.size(), idle);
    if (count < 0 && errno != EINTR) {
      throw CommandFailure(systemError("poll"));
    }
    // Idle, it does not end while something waits for a disk that is full, say.
    ends = (count == 0 && listener.write()) || (ready[1].revents & POLLIN) != 0;
    if (count > 0 && (ready[0].revents & POLLIN) != 0) {
      socket->receive(take);
    }
  }
  // What was sent before the end is counted; who floods on is not waited for.
  socket->close();
  for (const auto end = SteadyClock::now() + kMaxDrain;
       SteadyClock::now() < end && socket->receive(take);) {
  }
  if (!listener.write()) {
    throw CommandFailure("the last counters could not be written; the system log says why");
  }
}

}  // namespace

void addListenCommand(CLI::App& command) {
  const auto path = std::make_shared<std::optional<std::string>>();
  command
      .add_option("--socket", *path,
                  "Where to make the socket, unless the system hands one over; without it, "
                  "run/counters in the device directory")
      ->type_name("PATH");
  command.callback([path] { listen(*path); });
}

}  // namespace vesprun
