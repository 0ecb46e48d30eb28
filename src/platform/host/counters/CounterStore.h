#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "platform/Tallybook.h"
#include "platform/host/counters/SqliteConnection.h"

namespace vesprun {

/// True for a key that the database takes: UTF-8 text that an XML 1.0 document can carry, 1 MiB at
/// most. Otherwise `error` says what is wrong with it.
bool isCounterKey(std::string_view key, std::string& error);

/// The sum of two counts, which wraps around.
inline std::int64_t wrappingSum(std::int64_t left, std::int64_t right) {
  return static_cast<std::int64_t>(static_cast<std::uint64_t>(left) +
                                   static_cast<std::uint64_t>(right));
}

/// One recorded value of a distribution.
struct Sample {
  double value;
  std::int32_t secondsInDay;
};

/// The tables of the counter database, in one open file and one transaction. Every operation throws
/// `SqliteFailure`. What fails to be read is read once more, from a newly opened file, first.
///
/// Scalars are rows of day, key and value. The samples of a distribution are packed into chunks:
/// their values as little-endian doubles, and their offsets as little-endian 32-bit integers in a
/// column behind them, so that reading values alone never touches the pages of the offsets.
class CounterStore {
 public:
  static constexpr std::size_t kSamplesPerChunk = 4096;

  /// Reading takes back a commit that was cut off; looking touches no file.
  enum class Access { Looking, Reading, Writing };

  /// Opens an existing file. What another process has locked is waited for, `longestWait` at most.
  CounterStore(std::string path, std::chrono::milliseconds longestWait, Access access);

  /// The content of a new database file. Throws `SqliteFailure`.
  static std::string emptyDatabase();

  /// Makes everything that was written durable; without it, nothing of it is kept.
  void commit() { _connection.commit(); }

  const SqliteConnection& connection() const { return _connection; }

  // Keys are those that `isCounterKey` allows.

  void setScalar(std::int32_t day, std::string_view key, std::int64_t value);
  /// Adds with 64-bit wrap-around; a missing scalar counts as 0.
  void addToScalar(std::int32_t day, std::string_view key, std::int64_t value);
  /// Appends samples to a distribution, in order.
  void appendSamples(std::int32_t day, std::string_view key, std::span<const Sample> samples);

  /// Delivers rows as `TBHistory` does. A failure among the values of a distribution ends them for
  /// the handler, and is thrown when the handler has returned. The text of a failure says how far
  /// the reading came.
  void readScalars(std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
                   const TBHistory::ScalarRowHandler& handler);
  void readDistributions(std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
                         const TBHistory::DistributionRowHandler& handler);

  /// What `removeBefore` removed.
  struct Removed {
    std::vector<std::int32_t> days;  ///< ascending
    std::int64_t scalars = 0;
    std::int64_t distributions = 0;
  };

  /// Removes the rows of all days before `day`.
  Removed removeBefore(std::int64_t day);

  /// Gives the room that removed rows left back to the file system. A file that was made without
  /// room for the means to do so is written anew, for which all that was done before is committed.
  void giveRoomBack();

  /// The next day after `day` that has a row; nothing when there is none. `day` is 64 bits wide so
  /// that the first day can be asked for too.
  std::optional<std::int32_t> nextDay(std::int64_t day);

  /// Runs `step`, which reads, and again when it failed: statements made before belong to an
  /// earlier `opening` then and are of no more use. Not when a lock was waited for, nor in a
  /// transaction that writes.
  template <typename Step>
  auto readTwice(const Step& step) {
    try {
      return step();
    } catch (const SqliteFailure& failure) {
      if (_access == Access::Writing || failure.isBusy()) {
        throw;
      }
    }
    open();
    return step();
  }

  /// Changes when the file is opened again.
  int opening() const { return _opening; }

 private:
  /// Statements that write, prepared when the first one is needed.
  struct Writer;

  void open();
  template <typename Deliver>
  void forEachRow(const char* what, const char* select, std::string_view keyPrefix,
                  std::int32_t minDay, std::int32_t maxDay, const Deliver& deliver);
  Writer& writer();
  std::int64_t distributionForWriting(std::int32_t day, std::string_view key);

  std::string _path;
  std::chrono::milliseconds _longestWait;
  Access _access;
  int _opening = 0;
  SqliteConnection _connection;
  std::shared_ptr<Writer> _writer;
};

}  // namespace vesprun
