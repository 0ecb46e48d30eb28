#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

#include "platform/Tallybook.h"
#include "platform/host/counters/CounterStore.h"

namespace vesprun {

/// Reads the values of one distribution after another from their chunks.
class ChunkEnumerator final : public TBHistoryDistributionEnumerator {
 public:
  /// `store` must outlive the object.
  explicit ChunkEnumerator(CounterStore& store) : _store(store) {}

  /// Begins the distribution with that row number.
  void start(std::int64_t distribution);

  /// A failure ends the values and is kept for `rethrowFailure`: the reader of the values knows
  /// nothing of SQLite.
  bool getNextValueSecondsInDayOffset(double& value, std::int32_t* secondsInDay) override;
  std::size_t getNextValues(std::span<double> values) override;

  /// Its text says how many values came before.
  void rethrowFailure() const;

 private:
  std::span<const std::uint8_t> chunk(std::int64_t sequence);
  bool loadChunk();
  void loadOffsets();

  CounterStore& _store;
  int _opening = 0;  ///< of the store, for these statements
  std::optional<SqliteStatement> _chunks;
  std::int64_t _placedAt = -1;                   ///< the chunk of its next step
  std::optional<SqliteStatement> _chunkOffsets;  ///< made when someone asks for an offset
  std::int64_t _distribution = 0;
  std::int64_t _sequence = 0;  ///< of the next chunk
  const std::uint8_t* _values = nullptr;
  const std::uint8_t* _offsets = nullptr;
  std::size_t _next = 0;
  std::size_t _count = 0;
  std::uint64_t _taken = 0;  ///< of all chunks
  bool _exhausted = true;
  std::optional<SqliteFailure> _failure;
};

}  // namespace vesprun
