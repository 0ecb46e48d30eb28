#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "common/LittleEndian.h"

namespace vesprun {

/// The header of a record of the MSP buffer.
///
///     record: header, then `length` bytes of payload
///     header: key (bytes 0 to 1), length (bytes 2 to 3), both little-endian
///
/// Records lie back to back without padding, so that a header and the elements of a payload can be
/// at any address.
struct MSPRecordHeader {
  static constexpr std::size_t kSize = 2 + 2;
  static constexpr std::uint16_t kFiller = 0x2FFE;     ///< padding
  static constexpr std::uint16_t kEndMarker = 0x2FFF;  ///< ends the records

  std::uint16_t key;
  std::uint16_t length;

  static MSPRecordHeader decodeFrom(std::uint32_t bytes) {
    return {static_cast<std::uint16_t>(bytes), static_cast<std::uint16_t>(bytes >> 16)};
  }
  std::uint32_t encode() const { return std::uint32_t{length} << 16 | key; }
};

/// Walks the records of an MSP buffer without reading outside.
class MSPRecordReader {
 public:
  explicit MSPRecordReader(std::span<const std::uint8_t> buffer) : _rest(buffer) {}

  bool holdsHeader() const { return _rest.size() >= MSPRecordHeader::kSize; }
  /// Reads the next header, which must be there.
  MSPRecordHeader readHeader() {
    return MSPRecordHeader::decodeFrom(
        loadLittleEndian<std::uint32_t>(read(MSPRecordHeader::kSize).data()));
  }
  /// True when the buffer holds the payload of the header just read.
  bool holds(const MSPRecordHeader& header) const { return header.length <= _rest.size(); }
  /// Reads the next `size` bytes, which must be there.
  std::span<const std::uint8_t> read(std::size_t size) {
    const std::span<const std::uint8_t> bytes = _rest.first(size);
    _rest = _rest.subspan(size);
    return bytes;
  }

 private:
  std::span<const std::uint8_t> _rest;
};

}  // namespace vesprun
