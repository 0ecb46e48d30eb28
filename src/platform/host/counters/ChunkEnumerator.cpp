#include "platform/host/counters/ChunkEnumerator.h"

#include <bit>
#include <cstring>
#include <span>

namespace vesprun {

static_assert(std::endian::native == std::endian::little, "chunks are little-endian");

ChunkEnumerator::ChunkEnumerator(const SqliteConnection& connection)
    : _connection(connection),
      _chunks(connection,
              "SELECT samples, sequence FROM chunk WHERE distribution = ? ORDER BY sequence") {}

void ChunkEnumerator::start(std::int64_t distribution) {
  _distribution = distribution;
  _chunks.reset();
  _chunks.bind(1, distribution);
  _next = _count = 0;
  _nextSequence = 0;
  _exhausted = false;
}

void ChunkEnumerator::rethrowFailure() const {
  if (_failure) {
    std::rethrow_exception(_failure);
  }
}

bool ChunkEnumerator::getNextValueSecondsInDayOffset(double& value, std::int32_t* secondsInDay) {
  if (_failure) {
    return false;
  }
  if (_next == _count || (secondsInDay != nullptr && _offsets == nullptr)) {
    try {
      if (_next == _count && !loadChunk()) {
        return false;
      }
      if (secondsInDay != nullptr) {
        loadOffsets();
      }
    } catch (const SqliteFailure&) {
      _failure = std::current_exception();
      return false;
    }
  }
  std::memcpy(&value, _values + _next * sizeof value, sizeof value);
  if (secondsInDay != nullptr) {
    std::memcpy(secondsInDay, _offsets + _next * sizeof *secondsInDay, sizeof *secondsInDay);
  }
  ++_next;
  return true;
}

bool ChunkEnumerator::loadChunk() {
  do {
    if (_exhausted || !_chunks.step()) {
      _exhausted = true;
      return false;
    }
    const std::span<const std::uint8_t> values = _chunks.bytes(0);
    if (values.size() % sizeof(double) != 0) {
      _connection.failAsCorrupt("a chunk of samples has a wrong length");
    }
    if (_chunks.integer(1) != _nextSequence++) {
      _connection.failAsCorrupt("a chunk of samples is missing");
    }
    _values = values.data();
    _offsets = nullptr;
    _count = values.size() / sizeof(double);
    _next = 0;
  } while (_count == 0);
  return true;
}

// By a statement of their own: a column that a row names is read with the row.
void ChunkEnumerator::loadOffsets() {
  if (!_chunkOffsets) {
    _chunkOffsets.emplace(_connection,
                          "SELECT offsets FROM chunk WHERE distribution = ? AND sequence = ?");
  }
  _chunkOffsets->reset();
  const bool found = _chunkOffsets->bind(1, _distribution).bind(2, _chunks.integer(1)).step();
  const auto offsets = found ? _chunkOffsets->bytes(0) : std::span<const std::uint8_t>();
  if (offsets.size() != _count * sizeof(std::int32_t)) {
    _connection.failAsCorrupt("a chunk of offsets has a wrong length");
  }
  _offsets = offsets.data();
}

}  // namespace vesprun
