#pragma once

#include <cstdint>
#include <functional>
#include <limits>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>

#include "ExportedLine.h"

namespace vesprun {

/// Why a store cannot do what it was asked: one line that names the store.
class StoreFailure : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Both ends are included.
struct DayRange {
  std::int32_t from = std::numeric_limits<std::int32_t>::min();
  std::int32_t to = std::numeric_limits<std::int32_t>::max();
};

enum class KeyKind { Scalar, Distribution };

/// A key, and on how many devices and days it was reported.
struct ReportedKey {
  std::string key;
  KeyKind kind = KeyKind::Scalar;
  std::uint64_t devices = 0;
  std::uint64_t days = 0;
};

/// What many devices reported. For each device and day one line holds: that of the highest
/// revision; of equal revisions the one created later; then the one whose text is greater byte by
/// byte. The others are never seen. Order and repetition of lines make no difference.
///
/// Every operation throws `StoreFailure`.
class FleetStore {
 public:
  virtual ~FleetStore() = default;

  /// Takes a line. It is stored whole or not at all, and durable once `finish` has returned.
  virtual void add(const ExportedLine& line) = 0;
  virtual void finish() = 0;

  using VisitKey = std::function<void(const ReportedKey& key)>;
  using VisitScalar = std::function<void(std::int32_t day, std::int64_t value)>;
  using VisitDistribution = std::function<void(std::int32_t day, const Distribution& values)>;

  /// The keys of the lines that hold, by their bytes, a scalar before a distribution.
  virtual void visitKeys(const VisitKey& visit) = 0;
  /// What the devices reported under `key`, in any order.
  virtual void visitScalars(std::string_view key, const DayRange& days,
                            const VisitScalar& visit) = 0;
  virtual void visitDistributions(std::string_view key, const DayRange& days,
                                  const VisitDistribution& visit) = 0;
};

/// Opens the store at an address: a ClickHouse database when it begins with "http://", else an
/// SQLite file. To be loaded, what is missing is made: the file, readable for its owner alone, or
/// the tables. Throws `StoreFailure`.
std::unique_ptr<FleetStore> openFleetStore(const std::string& address, bool toBeLoaded);

}  // namespace vesprun
