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
/// Records lie back to back without padding, so that a header and the elements of a payload can
/// stand at any address.
struct MSPRecordHeader {
  static constexpr std::size_t kSize = 2 + 2;
  static constexpr std::uint16_t kFiller = 0x2FFE;     ///< a record that only takes up room
  static constexpr std::uint16_t kEndMarker = 0x2FFF;  ///< nothing behind it counts

  std::uint16_t key;
  std::uint16_t length;

  static MSPRecordHeader decodeFrom(std::span<const std::uint8_t, kSize> bytes) {
    return {loadLittleEndian<std::uint16_t>(bytes.data()),
            loadLittleEndian<std::uint16_t>(bytes.data() + 2)};
  }
};

}  // namespace vesprun
