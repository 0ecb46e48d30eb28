#pragma once

#include <sys/types.h>

#include <chrono>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

#include "platform/Clock.h"
#include "platform/host/counters/CounterStore.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// Where the database lies on a device.
inline constexpr std::string_view kCounterFolder = "var/mobile/Library/Tallybook";
inline constexpr const char* kCounterDatabase = "TBDataStore.sqlitedb";
/// The beginning of the names under which damaged databases are kept.
inline constexpr std::string_view kDamagedDatabase = "TBDataStore.sqlitedb.corrupt-";

/// What keeps the counters from being written, as far as a program can do something about it.
enum class CounterTrouble { Other, Busy, Full, NewerFile };

/// The file of the counter database, and how processes share, create and replace it: a shared lock
/// on its folder while it is open, the exclusive one to give its name to another file. Nothing is
/// open between operations. Safe from any thread.
class CounterFile {
 public:
  /// The references must outlive the object. `longestWait` limits the wait for another process's
  /// lock.
  CounterFile(const DeviceDirectory& directory, Clock& clock, std::chrono::milliseconds longestWait)
      : _directory(directory), _clock(clock), _longestWait(longestWait) {}

  /// A file that is not a sound counter database.
  struct Damage {
    dev_t device;
    ino_t number;
    std::string text;  ///< names the file and the trouble
  };

  /// Runs `work` on the tables in one transaction; creates a missing file. True when the
  /// transaction was committed. False, with nothing changed, when `work` failed, with its or our
  /// text in `error`, and in `damage` if the file is damaged; `trouble`, if given, tells what it
  /// was.
  bool write(const std::function<bool(CounterStore&)>& work, std::string& error,
             std::optional<Damage>& damage, CounterTrouble* trouble = nullptr);

  /// Runs `work` on the tables as of one moment; not at all, and true, without a file. False as
  /// above. On a read-only device no file is touched: a commit that was cut off or lies in a
  /// write-ahead log is an error, and damage is not reported as such, since it cannot be mended.
  bool read(const std::function<void(CounterStore&)>& work, std::string& error,
            std::optional<Damage>& damage);

  /// Moves the damaged file, with its journal, aside and puts an empty database in its place.
  /// Returns the new path, empty when another process has replaced it already; nothing, with a text
  /// in `error`, on failure.
  std::optional<std::string> replace(const Damage& damage, std::string& error);

 private:
  bool use(CounterStore::Access access, const std::function<bool(CounterStore&)>& work,
           std::string& error, std::optional<Damage>& damage, CounterTrouble& trouble);
  bool make(std::string& error, CounterTrouble& trouble);
  bool makeLocked(std::string& error);
  std::string unusedNameAside() const;

  const DeviceDirectory& _directory;
  Clock& _clock;
  std::chrono::milliseconds _longestWait;
};

/// Removes the damaged databases that were moved aside, with their journals, but the newest; and
/// that one, too, when it was moved before `time`. False, with a text in `error`, on failure.
bool removeOldDamaged(const DeviceDirectory& directory, const Date& time, std::string& error);

}  // namespace vesprun
