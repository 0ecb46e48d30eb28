#pragma once

#include <array>
#include <bit>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <span>

#include "NANDInfo/controller/NandExporter.h"

namespace vesprun {

/// The struct input of both phases of a tunnel command: little-endian, at these offsets.
struct TunnelRequest {
  std::uint32_t opcode = 0;        ///< 0
  std::uint32_t sizeQuery = 0;     ///< 4: 1 when the size is asked for, else 0; flags for a list
  std::uint32_t argument = 0;      ///< 8: MSP index, hours back, or 0
  std::uint32_t inputLength = 0;   ///< 12
  std::uint64_t inputAddress = 0;  ///< 16

  std::array<std::uint8_t, 24> encode() const {
    return std::bit_cast<std::array<std::uint8_t, 24>>(*this);
  }
};
static_assert(std::endian::native == std::endian::little);

/// Zeroed bytes for a driver to fill, of the size that it asks for, which may be close to 4 GiB.
/// Untouched memory is not used up.
class TunnelBuffer {
 public:
  TunnelBuffer() = default;
  /// Empty (see `operator bool`) when memory runs out.
  explicit TunnelBuffer(std::size_t size);

  explicit operator bool() const { return _bytes != nullptr; }
  std::size_t size() const { return _bytes ? _size : 0; }
  std::span<std::uint8_t> bytes() { return {_bytes.get(), size()}; }
  /// At most the first `length` bytes.
  std::span<const std::uint8_t> bytes(std::uint64_t length) const;

 private:
  struct Free {
    void operator()(std::uint8_t* bytes) const { std::free(bytes); }
  };

  std::unique_ptr<std::uint8_t[], Free> _bytes;
  std::size_t _size = 0;
};

/// Asks the controller for the answer's size, then for the answer. The argument comes in `request`,
/// the input length in `length`. True: `buffer` is a new block of that size, and `length` what the
/// driver reports, at most that size. False, with the error recorded: if the size could not be had,
/// `buffer` is empty and `length` 0, else both are unchanged.
bool executeTunnelCommand(RegistryHandle connection, const nand_exporter_t& exporter,
                          const TunnelSelector* selector, TunnelRequest& request,
                          TunnelBuffer& buffer, std::uint64_t& length);

}  // namespace vesprun
