#pragma once

#include <cstdint>
#include <cstring>
#include <stdexcept>
#include <string>
#include <string_view>
#include <type_traits>

namespace vesprun {

/// Appends an integer in groups of seven bits, low ones first. The highest bit of a byte is set
/// when more follow.
inline void appendVarint(std::string& bytes, std::uint64_t value) {
  while (value >= 0x80) {
    bytes.push_back(static_cast<char>(value | 0x80));
    value >>= 7;
  }
  bytes.push_back(static_cast<char>(value));
}

/// The same for signed integers: the sign moves to the lowest bit, so that small ones stay short.
inline void appendSigned(std::string& bytes, std::int64_t value) {
  appendVarint(bytes,
               static_cast<std::uint64_t>(value) << 1 ^ static_cast<std::uint64_t>(value >> 63));
}

/// The bytes of a number as they lie in memory.
template <typename T>
void appendRaw(std::string& bytes, T value) {
  static_assert(std::is_arithmetic_v<T>);
  char raw[sizeof value];
  std::memcpy(raw, &value, sizeof value);
  bytes.append(raw, sizeof raw);
}

/// A text behind its length.
inline void appendText(std::string& bytes, std::string_view text) {
  appendVarint(bytes, text.size());
  bytes.append(text);
}

/// Reads what these functions append. Reading beyond the end throws `std::out_of_range`.
class PackedReader {
 public:
  explicit PackedReader(std::string_view bytes) : _bytes(bytes) {}

  bool atEnd() const { return _bytes.empty(); }
  const char* position() const { return _bytes.data(); }

  std::uint64_t varint() {
    std::uint64_t value = 0;
    for (unsigned shift = 0; shift < 64; shift += 7) {
      const auto byte = static_cast<std::uint8_t>(take(1).front());
      value |= std::uint64_t{byte & 0x7FU} << shift;
      if (byte < 0x80) {
        return value;
      }
    }
    throw std::out_of_range("an integer that does not end");
  }

  std::int64_t signedInteger() {
    const std::uint64_t value = varint();
    return static_cast<std::int64_t>(value >> 1 ^ (~(value & 1) + 1));
  }

  template <typename T>
  T raw() {
    T value;
    std::memcpy(&value, take(sizeof value).data(), sizeof value);
    return value;
  }

  std::string text() { return std::string(take(varint())); }

 private:
  std::string_view take(std::uint64_t count) {
    if (_bytes.size() < count) {
      throw std::out_of_range("an entry that is cut");
    }
    const std::string_view taken = _bytes.substr(0, static_cast<std::size_t>(count));
    _bytes.remove_prefix(taken.size());
    return taken;
  }

  std::string_view _bytes;
};

}  // namespace vesprun
