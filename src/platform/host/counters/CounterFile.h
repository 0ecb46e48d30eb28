#pragma once

#include <sys/types.h>

#include <chrono>
#include <functional>
#include <optional>
#include <string>

#include "platform/Clock.h"
#include "platform/host/counters/CounterStore.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// The file of the counter database, and the rules by which processes share, make and replace it:
/// a shared lock on its folder while it is open, the exclusive one to give its name to another
/// file. Nothing is open between two operations. May be used from any thread.
class CounterFile {
 public:
  /// What the references name must outlive the object. A lock that another process holds is waited
  /// for, `longestWait` at most.
  CounterFile(const DeviceDirectory& directory, Clock& clock, std::chrono::milliseconds longestWait)
      : _directory(directory), _clock(clock), _longestWait(longestWait) {}

  /// A file that turned out to be no sound counter database.
  struct Damage {
    dev_t device;
    ino_t number;
    std::string text;  ///< names the file and the trouble
  };

  /// Runs `work` on the tables in one transaction, and once more when it came across damage; a file
  /// that is missing is made first. True when the transaction was committed. False when `work` said
  /// so or failed, with its or our text in `error`, and in `damage` when the file was found damaged
  /// twice: nothing was changed.
  bool write(const std::function<bool(CounterStore&)>& work, std::string& error,
             std::optional<Damage>& damage);

  /// Runs `work` on the tables as they stand at one moment; not at all, and true, when there is no
  /// file. False as above. On a read-only device the file and what lies beside it stay untouched: a
  /// commit that was cut off or that lies in a write-ahead log is an error, and damage is not told
  /// apart, since nobody may mend it.
  bool read(const std::function<void(CounterStore&)>& work, std::string& error,
            std::optional<Damage>& damage);

  /// Moves the damaged file, with its journal, aside and puts an empty database in its place. Gives
  /// the path it was moved to, empty when another process has replaced it already; nothing, with a
  /// text in `error`, when that failed.
  std::optional<std::string> replace(const Damage& damage, std::string& error);

 private:
  bool use(CounterStore::Access access, const std::function<bool(CounterStore&)>& work,
           std::string& error, std::optional<Damage>& damage);
  bool make(std::string& error);
  bool makeLocked(std::string& error);
  std::string unusedNameAside() const;

  const DeviceDirectory& _directory;
  Clock& _clock;
  std::chrono::milliseconds _longestWait;
};

}  // namespace vesprun
