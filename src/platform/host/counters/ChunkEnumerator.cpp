#include "platform/host/counters/ChunkEnumerator.h"

#include <algorithm>
#include <bit>
#include <cstring>

namespace vesprun {

static_assert(std::endian::native == std::endian::little, "chunks are little-endian");

void ChunkEnumerator::start(std::int64_t distribution) {
  _distribution = distribution;
  _placedAt = -1;
  _sequence = 0;
  _next = _count = 0;
  _taken = 0;
  _exhausted = false;
}

void ChunkEnumerator::rethrowFailure() const {
  if (_failure) {
    throw SqliteFailure(*_failure);
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
    } catch (const SqliteFailure& failure) {
      _failure = SqliteFailure{failure.code, failure.text + ", after " + std::to_string(_taken) +
                                                 " values of the last of"};
      return false;
    }
  }
  std::memcpy(&value, _values + _next * sizeof value, sizeof value);
  if (secondsInDay != nullptr) {
    std::memcpy(secondsInDay, _offsets + _next * sizeof *secondsInDay, sizeof *secondsInDay);
  }
  ++_next;
  ++_taken;
  return true;
}

std::size_t ChunkEnumerator::getNextValues(std::span<double> values) {
  if (!getNextValueSecondsInDayOffset(values[0], nullptr)) {
    return 0;
  }
  const std::size_t rest = std::min(values.size() - 1, _count - _next);
  std::memcpy(values.data() + 1, _values + _next * sizeof(double), rest * sizeof(double));
  _next += rest;
  _taken += rest;
  return rest + 1;
}

// `length` knows the size of a column without reading it.
std::span<const std::uint8_t> ChunkEnumerator::chunk(std::int64_t sequence) {
  const SqliteConnection& connection = _store.connection();
  if (_opening != _store.opening()) {
    _chunks.emplace(connection,
                    "SELECT samples, sequence, length(offsets) FROM chunk "
                    "WHERE distribution = ? AND sequence >= ? ORDER BY sequence");
    _chunkOffsets.reset();
    _opening = _store.opening();
    _placedAt = -1;
  }
  if (_placedAt != sequence) {
    _chunks->reset();
    _chunks->bind(1, _distribution).bind(2, sequence);
  }
  _placedAt = sequence + 1;
  if (!_chunks->step()) {
    return {};
  }
  const std::span<const std::uint8_t> values = _chunks->bytes(0);
  if (_chunks->integer(1) != sequence) {
    connection.failAsCorrupt("a chunk of samples is missing");
  }
  const std::size_t count = values.size() / sizeof(double);
  if (count == 0 || values.size() % sizeof(double) != 0 ||
      _chunks->integer(2) != static_cast<std::int64_t>(count * sizeof(std::int32_t))) {
    connection.failAsCorrupt("a chunk of samples has a wrong length");
  }
  return values;
}

bool ChunkEnumerator::loadChunk() {
  const auto values = _store.readTwice([this] {
    const auto found = _exhausted ? std::span<const std::uint8_t>() : chunk(_sequence);
    if (!found.empty() && _sequence != 0 && _count != CounterStore::kSamplesPerChunk) {
      _store.connection().failAsCorrupt("a chunk of samples is too short");
    }
    return found;
  });
  _exhausted = values.empty();
  if (_exhausted) {
    return false;
  }
  _values = values.data();
  _offsets = nullptr;
  _count = values.size() / sizeof(double);
  _next = 0;
  ++_sequence;
  return true;
}

// Separate: reading a row reads all its named columns.
void ChunkEnumerator::loadOffsets() {
  _offsets = _store.readTwice([this] {
    if (_opening != _store.opening()) {  // the values went with the earlier connection
      const auto values = chunk(_sequence - 1);
      if (values.size() != _count * sizeof(double)) {
        _store.connection().failAsCorrupt("a chunk of samples changes while it is read");
      }
      _values = values.data();
    }
    if (!_chunkOffsets) {
      _chunkOffsets.emplace(_store.connection(),
                            "SELECT offsets FROM chunk WHERE distribution = ? AND sequence = ?");
    }
    _chunkOffsets->reset();
    const bool found = _chunkOffsets->bind(1, _distribution).bind(2, _sequence - 1).step();
    const auto offsets = found ? _chunkOffsets->bytes(0) : std::span<const std::uint8_t>();
    if (offsets.size() != _count * sizeof(std::int32_t)) {
      _store.connection().failAsCorrupt("a chunk of offsets has a wrong length");
    }
    return offsets.data();
  });
}

}  // namespace vesprun
