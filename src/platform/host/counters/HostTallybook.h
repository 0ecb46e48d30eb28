#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <list>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "platform/Clock.h"
#include "platform/Preferences.h"
#include "platform/SystemLog.h"
#include "platform/Tallybook.h"
#include "platform/host/counters/CounterFile.h"
#include "platform/host/counters/CounterStore.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/FileLock.h"

namespace vesprun {

/// The counter database in `var/mobile/Library/Tallybook/TBDataStore.sqlitedb`. It is opened when
/// something is read or written, and not before.
///
/// A file found damaged twice in a row, or of another shape, is moved aside with its journal under
/// a name with the time ("TBDataStore.sqlitedb.corrupt-20240305T091502Z"), an empty one takes its
/// place, the integer preference "DatabaseCorruptionCount" of "com.quill.aggregated" goes up by
/// one, an error line says so, and the work goes on. Locks that last, permissions, full disks and
/// all other errors of the system are not damage: an error line says what failed, and what was to
/// be written stays collected. Several processes may use the database at once.
class HostTallybook final : public Tallybook {
 public:
  /// What the references name must outlive the object. While other processes keep the database
  /// locked, an operation waits for `longestWait` at most.
  HostTallybook(const DeviceDirectory& directory, Clock& clock, Preferences& preferences,
                SystemLog& log, std::chrono::milliseconds longestWait = kLongestLockWait);
  /// Writes what is still collected; an error line says when that is lost.
  ~HostTallybook() override;
  HostTallybook(const HostTallybook&) = delete;
  HostTallybook& operator=(const HostTallybook&) = delete;

  std::int32_t TBDaysSince1970() override;
  Date dateForDaysSince1970(std::int32_t day) override;
  void TBClientCheckpoint() override;
  void TBClientSetValueForScalarKey(std::string_view key, std::int64_t value) override;
  void TBClientAddValueForScalarKey(std::string_view key, std::int64_t value) override;
  std::unique_ptr<TBHistory> initWithDefaultPath() override;

  // The same for those who want to know why it failed: false, with a text in `error`. Beside
  // scalars, they collect samples of today, recorded at the clock's time of day.
  bool setScalar(std::string_view key, std::int64_t value, std::string& error);
  bool addToScalar(std::string_view key, std::int64_t value, std::string& error);
  bool addSample(std::string_view key, double value, std::string& error);
  bool checkpoint(std::string& error);

  // What tools need beside. Each writes or reads at once, all or nothing; false, with a text in
  // `error`, when that failed.

  /// Runs `work` on the tables in one transaction. When it finds the database damaged, `work` runs
  /// again on the same file, and at last on a new one. A false result takes everything back.
  bool write(const std::function<bool(CounterStore&)>& work, std::string& error);

  /// Runs `work` on the tables as they stand at one moment; without a database it is not run. False
  /// also when the database cannot be read to its end: `work` has then seen the rows before that
  /// point, which `error` names.
  bool read(const std::function<void(CounterStore&)>& work, std::string& error);

 private:
  struct PendingScalar {
    bool isSet;  ///< replaces what is stored, rather than adding to it
    std::int64_t value;
  };

  /// Day and key, in the order of the database; found by a `string_view` too.
  using Place = std::pair<std::int32_t, std::string>;
  struct PlaceOrder {
    using is_transparent = void;
    bool operator()(const auto& left, const auto& right) const {
      return left.first != right.first
                 ? left.first < right.first
                 : std::string_view(left.second) < std::string_view(right.second);
    }
  };

  struct Changes {
    std::map<Place, PendingScalar, PlaceOrder> scalars;
    /// A list: pieces of two batches are joined without memory.
    std::map<Place, std::list<std::vector<Sample>>, PlaceOrder> samples;
  };

  class History;

  template <typename Counters>
  static typename Counters::mapped_type* pendingCounter(Counters& counters, std::int32_t day,
                                                        std::string_view key, std::string& error);
  void logRefusal(const std::string& error);
  void keepChanges(Changes& changes);
  bool recover(const CounterFile::Damage& damage, std::string& error);

  Clock& _clock;
  Preferences& _preferences;
  SystemLog& _log;
  CounterFile _file;
  std::mutex _checkpointMutex;  ///< held for the whole of a checkpoint
  std::mutex _pendingMutex;
  Changes _pending;
};

}  // namespace vesprun
