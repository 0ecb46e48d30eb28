#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string_view>
#include <type_traits>

namespace vesprun {

/// A field name in two parts: "bandsMaxTempHisto_21" is the stem "bandsMaxTempHisto_" and the
/// number 21.
struct FieldName {
  static constexpr std::uint32_t kNoNumber = std::numeric_limits<std::uint32_t>::max();

  std::string_view stem;
  std::uint32_t number = kNoNumber;
};

/// Splits off a final decimal number of at most nine digits without leading zeros, so that each
/// name splits in one way and its parts make the name again.
constexpr FieldName splitFieldName(std::string_view name) {
  std::size_t stemLength = name.size();
  while (stemLength > 0 && name[stemLength - 1] >= '0' && name[stemLength - 1] <= '9') {
    --stemLength;
  }
  const std::string_view digits = name.substr(stemLength);
  if (digits.empty() || digits.size() > 9 || (digits.size() > 1 && digits.front() == '0')) {
    return {name};
  }
  std::uint32_t number = 0;
  for (const char digit : digits) {
    number = number * 10 + static_cast<std::uint32_t>(digit - '0');
  }
  return {name.substr(0, stemLength), number};
}

/// The same value when a table is compiled and when it is searched. Takes eight bytes at a time, as
/// names are long and looked up by the thousand.
constexpr std::uint32_t hashOfFieldName(std::string_view name) {
  constexpr std::uint64_t kFactor = 0x9E3779B97F4A7C15U;
  std::uint64_t hash = name.size();
  while (!name.empty()) {
    const std::size_t length = name.size() < 8 ? name.size() : 8;
    std::uint64_t word = 0;
    if (length == 8 && !std::is_constant_evaluated()) {
      std::memcpy(&word, name.data(), 8);
    } else {
      for (std::size_t i = 0; i < length; ++i) {
        word |= std::uint64_t{static_cast<unsigned char>(name[i])} << (8 * i);
      }
    }
    hash = (hash ^ word) * kFactor;
    hash ^= hash >> 32;
    name.remove_prefix(length);
  }
  // The high bits: the last bytes have not changed the lowest ones yet.
  return static_cast<std::uint32_t>(hash * kFactor >> 32);
}

/// A name that is being built, also at compile time.
class NameText {
 public:
  constexpr NameText& append(std::string_view text) {
    for (const char character : text) {
      _text.at(_size++) = character;
    }
    return *this;
  }
  /// Nothing for `FieldName::kNoNumber`.
  constexpr NameText& append(std::uint32_t number) {
    if (number != FieldName::kNoNumber) {
      std::uint32_t power = 1;
      while (number / power >= 10) {
        power *= 10;
      }
      for (; power != 0; power /= 10) {
        _text.at(_size++) = static_cast<char>('0' + number / power % 10);
      }
    }
    return *this;
  }
  constexpr operator std::string_view() const { return {_text.data(), _size}; }

 private:
  static constexpr std::size_t kMaxLength = 128;

  std::array<char, kMaxLength> _text{};
  std::size_t _size = 0;
};

}  // namespace vesprun
