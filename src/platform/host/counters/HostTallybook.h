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
#include "platform/host/files/Files.h"

namespace vesprun {

/// The counter database, `var/mobile/Library/Tallybook/TBDataStore.sqlitedb`, opened only to read
/// or write.
///
/// A file that is twice found damaged, or of another shape, is moved aside with its journal
/// ("TBDataStore.sqlitedb.corrupt-20240305T091502Z"); an empty one replaces it, the integer
/// preference "DatabaseCorruptionCount" of "com.quill.aggregated" goes up by one, with an error
/// line, and the work continues. Lasting locks, permissions, full disks and other system errors are
/// not damage: an error line names them, and unwritten changes stay collected. Several processes
/// may use the database at once.
class HostTallybook : public Tallybook {
 public:
  /// The references must outlive the object. An operation waits `longestWait` at most for other
  /// processes.
  HostTallybook(const DeviceDirectory& directory, Clock& clock, Preferences& preferences,
                SystemLog& log, std::chrono::milliseconds longestWait = kMaxLockWait);
  /// Writes what is collected; an error line reports a loss.
  ~HostTallybook() override;
  HostTallybook(const HostTallybook&) = delete;
  HostTallybook& operator=(const HostTallybook&) = delete;

  std::int32_t TBDaysSince1970() override;
  Date dateForDaysSince1970(std::int32_t day) override;
  void TBClientCheckpoint() override;
  void TBClientSetValueForScalarKey(std::string_view key, std::int64_t value) override;
  void TBClientAddValueForScalarKey(std::string_view key, std::int64_t value) override;
  std::unique_ptr<TBHistory> initWithDefaultPath() override;

  // The same with a result: false, with a text in `error`, on failure. Samples of today carry the
  // clock's time of day.
  bool setScalar(std::string_view key, std::int64_t value, std::string& error);
  bool addToScalar(std::string_view key, std::int64_t value, std::string& error);
  bool addSample(std::string_view key, double value, std::string& error);
  bool checkpoint(std::string& error, CounterTrouble* trouble = nullptr);

  // For tools. Each takes effect at once, all or nothing; false, with a text in `error`, on
  // failure.

  /// Runs `work` in one transaction; after damage again on the same file, and at last on a new one.
  /// A false result undoes everything.
  bool write(const std::function<bool(CounterStore&)>& work, std::string& error,
             CounterTrouble* trouble = nullptr);

  /// Runs `work` on the tables as of one moment; not without a database. False also when the
  /// database cannot be read to its end: `work` has seen the rows before the point that `error`
  /// names.
  bool read(const std::function<void(CounterStore&)>& work, std::string& error);

 private:
  struct PendingScalar {
    bool isSet;  ///< replaces instead of adding
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
  std::mutex _checkpointMutex;  ///< during a checkpoint
  std::mutex _pendingMutex;
  Changes _pending;
};

}  // namespace vesprun
