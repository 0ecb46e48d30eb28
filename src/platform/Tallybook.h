#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string_view>

#include "common/Calendar.h"

namespace vesprun {

/// The values of one distribution row, in the order in which they were recorded.
class TBHistoryDistributionEnumerator {
 public:
  virtual ~TBHistoryDistributionEnumerator() = default;

  /// Writes the next value, and its offset in seconds within the day unless `secondsInDay` is null,
  /// and returns true; or returns false, leaving both untouched, when the values are exhausted.
  virtual bool getNextValueSecondsInDayOffset(double& value, std::int32_t* secondsInDay) = 0;
};

/// The recorded rows of the counter database. Both queries deliver the rows of every day from
/// `minDay` to `maxDay`, both included, whose key begins with `keyPrefix` (the empty prefix: every
/// key), by ascending day and then by ascending key (byte order). Setting `stop` ends the query
/// after the row. A database that cannot be read delivers the rows before the damage, and of the
/// row with the damage the values before it; the service reports it in the system log, and the
/// query gives false.
class TBHistory {
 public:
  using ScalarRowHandler =
      std::function<void(std::string_view key, std::int32_t day, std::int64_t value, bool& stop)>;
  /// The enumerator is valid only during the call.
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

/// The device's counter database: named scalars and value distributions, stored per day.
///
/// Writes are collected in memory and reach the database at a checkpoint, all or none. They may
/// come from any thread. A key must be UTF-8 text that an XML 1.0 document can carry, 1 MiB at
/// most; the write of any other key is refused with an error in the system log.
class Tallybook {
 public:
  virtual ~Tallybook() = default;

  /// Today's day number; days begin at 00:00 UTC.
  virtual std::int32_t TBDaysSince1970() = 0;

  /// The instant at which a day begins.
  virtual Date dateForDaysSince1970(std::int32_t day) = 0;

  /// Makes all collected writes durable. When the database cannot be written, they stay collected
  /// for the next checkpoint and the system log says why.
  virtual void TBClientCheckpoint() = 0;

  /// Sets a scalar of today.
  virtual void TBClientSetValueForScalarKey(std::string_view key, std::int64_t value) = 0;

  /// Adds to a scalar of today, wrapping in 64 bits; a missing one counts as 0.
  virtual void TBClientAddValueForScalarKey(std::string_view key, std::int64_t value) = 0;

  /// A history of the device's own database. It sees what the last checkpoint wrote.
  virtual std::unique_ptr<TBHistory> initWithDefaultPath() = 0;
};

}  // namespace vesprun
