#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "common/LittleEndian.h"

namespace vesprun {

/// The header word of a record of the base and FTL statistics buffers.
///
///     record: header word, then `count` payload words
///     header: key id (bits 0 to 31), count (bits 32 to 63)
///     word:   64 bits, little-endian
///
/// Records lie back to back, with no buffer header and no padding. One to seven bytes at the end of
/// a buffer, too few for a word, are ignored.
struct StatisticsRecordHeader {
  /// The largest valid id.
  static constexpr std::uint32_t kMaxId = 0x30000000;

  std::uint32_t id;
  std::uint32_t count;  ///< words that follow the header

  static StatisticsRecordHeader decodeFrom(std::uint64_t word) {
    return {static_cast<std::uint32_t>(word), static_cast<std::uint32_t>(word >> 32)};
  }
  std::uint64_t encode() const { return std::uint64_t{count} << 32 | id; }
};

/// Walks the words of a statistics buffer, at any address, without reading outside.
class StatisticsRecordReader {
 public:
  static constexpr std::size_t kWordSize = sizeof(std::uint64_t);

  explicit StatisticsRecordReader(std::span<const std::uint8_t> buffer)
      : _rest(buffer.first(buffer.size() / kWordSize * kWordSize)) {}

  /// Whole words from the current one on.
  std::size_t remaining() const { return _rest.size() / kWordSize; }

  /// The word at `index` from here, which is below `remaining()`.
  std::uint64_t word(std::size_t index) const {
    return loadLittleEndian<std::uint64_t>(_rest.data() + index * kWordSize);
  }
  const std::uint8_t* data() const { return _rest.data(); }

  /// Reads the current word, which must be there, as a header.
  StatisticsRecordHeader readHeader() {
    const auto header = StatisticsRecordHeader::decodeFrom(word(0));
    skip(1);
    return header;
  }
  /// True when the header just read has a valid id and the buffer holds its payload.
  bool holds(const StatisticsRecordHeader& header) const {
    return header.id <= StatisticsRecordHeader::kMaxId && header.count <= remaining();
  }
  /// There must be as many.
  void skip(std::size_t words) { _rest = _rest.subspan(words * kWordSize); }

 private:
  std::span<const std::uint8_t> _rest;
};

}  // namespace vesprun
