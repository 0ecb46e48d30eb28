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
  /// Larger ids are no ids of records; this one still is.
  static constexpr std::uint32_t kLargestId = 0x30000000;

  std::uint32_t id;
  std::uint32_t count;  ///< words that follow the header

  static StatisticsRecordHeader decodeFrom(std::uint64_t word) {
    return {static_cast<std::uint32_t>(word), static_cast<std::uint32_t>(word >> 32)};
  }
  std::uint64_t encode() const { return std::uint64_t{count} << 32 | id; }
};

/// Walks the words of a statistics buffer, which it never reads outside of. The buffer need not be
/// aligned.
class StatisticsRecordReader {
 public:
  static constexpr std::size_t kWordSize = sizeof(std::uint64_t);

  explicit StatisticsRecordReader(std::span<const std::uint8_t> buffer)
      : _rest(buffer.first(buffer.size() / kWordSize * kWordSize)) {}

  /// The number of whole words from the current one to the end of the buffer.
  std::size_t remaining() const { return _rest.size() / kWordSize; }

  /// The word `index` words behind the current one; `index` is below `remaining()`.
  std::uint64_t word(std::size_t index) const {
    return loadLittleEndian<std::uint64_t>(_rest.data() + index * kWordSize);
  }
  /// The current word and all behind it.
  const std::uint8_t* data() const { return _rest.data(); }

  /// Takes the current word, which there must be, as a header and moves behind it.
  StatisticsRecordHeader readHeader() {
    const auto header = StatisticsRecordHeader::decodeFrom(word(0));
    skip(1);
    return header;
  }
  /// True when the header just read has a valid id and its payload lies within the buffer.
  bool holds(const StatisticsRecordHeader& header) const {
    return header.id <= StatisticsRecordHeader::kLargestId && header.count <= remaining();
  }
  /// Moves `words` words on; there are at least as many.
  void skip(std::size_t words) { _rest = _rest.subspan(words * kWordSize); }

 private:
  std::span<const std::uint8_t> _rest;
};

}  // namespace vesprun
