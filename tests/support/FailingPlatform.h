#pragma once

#include <memory>
#include <mutex>
#include <new>
#include <set>
#include <string>
#include <thread>

#include "support/WatchedRegistry.h"

namespace vesprun {

/// Makes one call of all that go to a platform's services fail, and notes the operations called.
class Faults {
 public:
  enum class Kind {
    Failure,     ///< the operation answers with the failure that it documents
    OutOfMemory  ///< the operation throws; only calls of the main thread count
  };

  /// The call to fail is counted from 1; 0: none.
  Faults(Kind kind, std::size_t call) : _kind(kind), _failing(call) {}

  /// A call of an operation that documents a failure: true when it is this call's turn.
  bool fails(const std::string& operation) { return isTurn(operation, true); }
  /// A call of an operation that has no way to fail but memory.
  void passes(const std::string& operation) { isTurn(operation, false); }

  /// The operation that failed; empty when fewer calls were made.
  const std::string& failed() const { return _failed; }
  bool called(const std::string& operation) const { return _called.contains(operation); }

 private:
  bool isTurn(const std::string& operation, bool documentsFailure) {
    const std::lock_guard lock(_mutex);
    _called.insert(operation);
    const bool counts =
        _kind == Kind::Failure ? documentsFailure : std::this_thread::get_id() == _mainThread;
    if (!counts || ++_calls != _failing) {
      return false;
    }
    _failed = operation;
    if (_kind == Kind::OutOfMemory) {
      throw std::bad_alloc();
    }
    return true;
  }

  const Kind _kind;
  const std::size_t _failing;
  const std::thread::id _mainThread = std::this_thread::get_id();
  std::mutex _mutex;
  std::size_t _calls = 0;
  std::string _failed;
  std::set<std::string> _called;
};

/// The platform of a device with calls that fail. It outlives the device's platform, whose threads
/// may still call it at the end.
std::shared_ptr<Platform> failingPlatform(HostPlatform& host, Faults& faults);

}  // namespace vesprun
