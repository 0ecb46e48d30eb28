#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string_view>

#include "common/Calendar.h"

namespace vesprun {

/// The values of a distribution row in recorded order.
class TBHistoryDistributionEnumerator {
 public:
  virtual ~TBHistoryDistributionEnumerator() = default;

  /// Gives the next value and, unless `secondsInDay` is null, its offset in seconds within the day.
  /// False, and both untouched, after the last one.
  virtual bool getNextValueSecondsInDayOffset(double& value, std::int32_t* secondsInDay) = 0;

  /// Fills `values`, which must not be empty, with the next ones, without their offsets, and
  /// returns their number: 0 after the last one; fewer than asked for at the end, or where the next
  /// one is stored elsewhere.
  virtual std::size_t getNextValues(std::span<double> values) {
    return getNextValueSecondsInDayOffset(values[0], nullptr) ? 1 : 0;
  }
};

/// The rows of the counter database. Both queries deliver the rows from `minDay` to `maxDay`, both
/// included, whose key begins with `keyPrefix`, by day and then by key (byte order). Setting `stop`
/// ends the query. Of a damaged database they deliver what comes before the damage and return
/// false; the damage is reported in the system log.
class TBHistory {
 public:
  using ScalarRowHandler =
      std::function<void(std::string_view key, std::int32_t day, std::int64_t value, bool& stop)>;
  /// The enumerator lives as long as the call.
  using DistributionRowHandler = std::function<void(
      std::string_view key, std::int32_t day, TBHistoryDistributionEnumerator& values, bool& stop)>;

  virtual ~TBHistory() = default;

  virtual bool scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
      std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
      const ScalarRowHandler& rowHandler) = 0;

  virtual bool distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
      std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
      const DistributionRowHandler& rowHandler) = 0;
};

/// The device's counter database: named scalars and value distributions for each day.
///
/// Writes are collected in memory and reach the database at a checkpoint, all or none. They may
/// come from any thread. A key is UTF-8 that an XML 1.0 document can carry, 1 MiB at most; any
/// other is refused with an error in the system log.
class Tallybook {
 public:
  virtual ~Tallybook() = default;

  /// Today's day number; days begin at 00:00 UTC.
  virtual std::int32_t TBDaysSince1970() = 0;

  /// The first instant of a day.
  virtual Date dateForDaysSince1970(std::int32_t day) = 0;

  /// Makes all collected writes durable. On failure they stay collected for the next checkpoint,
  /// and the system log says why.
  virtual void TBClientCheckpoint() = 0;

  /// Sets a scalar of today.
  virtual void TBClientSetValueForScalarKey(std::string_view key, std::int64_t value) = 0;

  /// Adds to a scalar of today, wrapping in 64 bits; a missing one counts as 0.
  virtual void TBClientAddValueForScalarKey(std::string_view key, std::int64_t value) = 0;

  /// A history of the device's database as of the last checkpoint.
  virtual std::unique_ptr<TBHistory> initWithDefaultPath() = 0;
};

}  // namespace vesprun
