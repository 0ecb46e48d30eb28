#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>

namespace vesprun {

/// The input at an odd address with nothing behind it, so that AddressSanitizer sees every read
/// outside of it and UndefinedBehaviorSanitizer every aligned one.
class ExactCopy {
 public:
  ExactCopy(const std::uint8_t* bytes, std::size_t size)
      : _bytes(new std::uint8_t[size + 1]), _size(size) {
    std::copy_n(bytes, size, _bytes.get() + 1);
  }
  std::span<const std::uint8_t> span() const { return {_bytes.get() + 1, _size}; }

 private:
  std::unique_ptr<std::uint8_t[]> _bytes;
  std::size_t _size;
};

}  // namespace vesprun
