#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

namespace vesprun {

/// The same value when a table is compiled and when it is searched. Takes eight bytes at a time, as
/// names are long and looked up by the thousand.
constexpr std::uint32_t hashOfText(std::string_view text) {
  constexpr std::uint64_t kFactor = 0x9E3779B97F4A7C15U;
  std::uint64_t hash = text.size();
  while (!text.empty()) {
    const std::size_t length = text.size() < 8 ? text.size() : 8;
    std::uint64_t word = 0;
    if (length == 8 && !std::is_constant_evaluated()) {
      std::memcpy(&word, text.data(), 8);
    } else {
      for (std::size_t i = 0; i < length; ++i) {
        word |= std::uint64_t{static_cast<unsigned char>(text[i])} << (8 * i);
      }
    }
    hash = (hash ^ word) * kFactor;
    hash ^= hash >> 32;
    text.remove_prefix(length);
  }
  // The high bits: the last bytes have not changed the lowest ones yet.
  return static_cast<std::uint32_t>(hash * kFactor >> 32);
}

/// A key of a `PropertyDict`, with a zero byte behind it: a copy of a text, or a text that lives as
/// long as the program, so that copies of the key cost no memory.
class PropertyKey : public std::string_view {
 public:
  PropertyKey() : PropertyKey({}, hashOfText({}), false) {}
  /// Copies the text.
  explicit PropertyKey(std::string_view text)
      : PropertyKey({copyOf(text), text.size()}, hashOfText(text), true) {}
  /// Refers to the text, which lives as long as the program and has a zero byte behind it.
  static PropertyKey permanent(std::string_view text, std::uint32_t hash) {
    return PropertyKey(text, hash, false);
  }

  PropertyKey(const PropertyKey& other)
      : PropertyKey({other._isCopy ? copyOf(other) : other.data(), other.size()}, other._hash,
                    other._isCopy) {}
  PropertyKey(PropertyKey&& other) noexcept
      : PropertyKey(other, other._hash, std::exchange(other._isCopy, false)) {
    other.remove_prefix(other.size());
  }
  PropertyKey& operator=(PropertyKey other) noexcept {
    swap(other);
    return *this;
  }
  ~PropertyKey() {
    if (_isCopy) {
      delete[] data();
    }
  }

  // Explicit: a `const std::string&` to a copy that nobody holds is easily kept too long.
  explicit operator std::string() const { return {data(), size()}; }
  const char* c_str() const { return empty() ? "" : data(); }
  std::string substr(std::size_t begin, std::size_t count = npos) const {
    return std::string(std::string_view::substr(begin, count));
  }
  std::uint32_t hash() const { return _hash; }

  friend bool operator==(const PropertyKey& left, const PropertyKey& right) {
    return left._hash == right._hash && std::string_view(left) == std::string_view(right);
  }
  friend std::string operator+(std::string left, const PropertyKey& right) {
    return std::move(left.append(right));
  }
  friend std::string operator+(const PropertyKey& left, std::string_view right) {
    return std::string(left).append(right);
  }
  friend std::string operator+(const PropertyKey& left, char right) {
    return left + std::string_view(&right, 1);
  }

 private:
  PropertyKey(std::string_view text, std::uint32_t hash, bool isCopy)
      : std::string_view(text), _hash(hash), _isCopy(isCopy) {}

  static const char* copyOf(std::string_view text) {
    char* const copy = new char[text.size() + 1];
    copy[text.copy(copy, text.size())] = '\0';
    return copy;
  }
  void swap(PropertyKey& other) noexcept {
    std::string_view::swap(other);
    std::swap(_hash, other._hash);
    std::swap(_isCopy, other._isCopy);
  }

  std::uint32_t _hash;
  bool _isCopy;
};

}  // namespace vesprun
