#pragma once

#include <cstddef>
#include <cstdint>
#include <exception>
#include <optional>

#include "platform/Tallybook.h"
#include "platform/host/counters/SqliteConnection.h"

namespace vesprun {

/// Takes the values out of the chunks of one distribution after another.
class ChunkEnumerator final : public TBHistoryDistributionEnumerator {
 public:
  /// `connection` must outlive the object. Throws `SqliteFailure`.
  explicit ChunkEnumerator(const SqliteConnection& connection);

  /// Begins with the distribution of that row number.
  void start(std::int64_t distribution);

  /// A failure ends the values; it is kept for `rethrowFailure`, since the code that takes the
  /// values knows nothing of SQLite.
  bool getNextValueSecondsInDayOffset(double& value, std::int32_t* secondsInDay) override;

  void rethrowFailure() const;

 private:
  bool loadChunk();
  void loadOffsets();

  const SqliteConnection& _connection;
  SqliteStatement _chunks;
  std::optional<SqliteStatement> _chunkOffsets;  ///< made when someone asks for an offset
  std::int64_t _distribution = 0;
  std::int64_t _nextSequence = 0;
  const std::uint8_t* _values = nullptr;
  const std::uint8_t* _offsets = nullptr;
  std::size_t _next = 0;
  std::size_t _count = 0;
  bool _exhausted = true;
  std::exception_ptr _failure;
};

}  // namespace vesprun
