#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <string_view>

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

/// A name in the making, also at compile time.
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
  static constexpr std::size_t kLongest = 128;

  std::array<char, kLongest> _text{};
  std::size_t _size = 0;
};

}  // namespace vesprun
