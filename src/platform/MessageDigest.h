#pragma once

#include <array>
#include <cstdint>
#include <string_view>

namespace vesprun {

class MessageDigest {
 public:
  virtual ~MessageDigest() = default;

  /// The MD5 digest (RFC 1321) of the bytes.
  virtual std::array<std::uint8_t, 16> md5(std::string_view bytes) = 0;
};

}  // namespace vesprun
