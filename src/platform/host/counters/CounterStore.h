#pragma once

#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "platform/Tallybook.h"
#include "platform/host/counters/SqliteConnection.h"

namespace vesprun {

/// True for UTF-8 that an XML 1.0 document can carry, 1 MiB at most; otherwise `error` says why
/// not.
bool isCounterKey(std::string_view key, std::string& error);

/// The sum, wrapped in 64 bits.
inline std::int64_t wrappingSum(std::int64_t left, std::int64_t right) {
  return static_cast<std::int64_t>(static_cast<std::uint64_t>(left) +
                                   static_cast<std::uint64_t>(right));
}

struct Sample {
  double value;
  std::int32_t secondsInDay;
};

/// The tables of the counter database in one open file and one transaction. Every operation throws
/// `SqliteFailure`; a failed read is first repeated on a newly opened file.
///
/// Scalars are rows of day, key and value. Samples are packed into chunks: values as little-endian
/// doubles, and behind them offsets as little-endian 32-bit integers, so that reading values alone
/// never touches the offsets' pages.
class CounterStore {
 public:
  static constexpr std::size_t kSamplesPerChunk = 4096;

  /// Reading rolls back an interrupted commit; looking never modifies a file.
  enum class Access { Looking, Reading, Writing };

  /// Opens an existing file, waiting `longestWait` at most for another process's lock.
  CounterStore(std::string path, std::chrono::milliseconds longestWait, Access access);

  /// Throws `SqliteFailure`.
  static std::string emptyDatabase();

  /// Makes all writes durable; without it they are lost.
  void commit() { _connection.commit(); }

  const SqliteConnection& connection() const { return _connection; }

  /// Makes the table `mark` (place, device, value, text), unless it is there.
  void makeMarkTable();

  // Keys are those that `isCounterKey` allows.

  void setScalar(std::int32_t day, std::string_view key, std::int64_t value);
  /// Adds with 64-bit wrap-around; a missing scalar counts as 0.
  void addToScalar(std::int32_t day, std::string_view key, std::int64_t value);
  /// Appends samples to a distribution, in order.
  void appendSamples(std::int32_t day, std::string_view key, std::span<const Sample> samples);

  /// Delivers rows as `TBHistory` does. A failure within a distribution ends its values and is
  /// thrown after the handler. Its text says how far the reading came.
  void readScalars(std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
                   const TBHistory::ScalarRowHandler& handler);
  void readDistributions(std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
                         const TBHistory::DistributionRowHandler& handler);

  struct Rows {
    std::vector<std::int32_t> days;  ///< ascending
    std::int64_t scalars = 0;
    std::int64_t distributions = 0;
  };

  /// How many rows there are of days before `day`.
  Rows rowsBefore(std::int64_t day);

  /// Removes all rows of a day.
  void removeDay(std::int32_t day);

  /// Returns the space of removed rows to the file system. A file that was made without incremental
  /// vacuum is rewritten with it, for which all that was done before is committed.
  void returnFreeSpace();

  /// The next day after `day` with a row. `day` has 64 bits so that the first day can be asked for.
  std::optional<std::int32_t> nextDay(std::int64_t day);

  /// Runs `step`, which reads, and again if it failed: what was delivered cannot be taken back, so
  /// reading goes on from there. Earlier statements then belong to an earlier `opening` and are
  /// useless. Not after waiting for a lock, nor in a transaction that writes: it is run again
  /// whole.
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
  /// Writing statements, prepared on demand.
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
