#pragma once

#include <array>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
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

/// Puts the parts together.
inline void assignFieldName(std::string& name, std::string_view stem, std::uint32_t number) {
  name = stem;
  if (number != FieldName::kNoNumber) {
    std::array<char, 10> digits;
    const auto [end, error] = std::to_chars(digits.data(), digits.data() + digits.size(), number);
    name.append(digits.data(), end);
  }
}

/// Equal at compile time and at run time. Takes eight bytes at a time: names are long and looked up
/// by the thousand.
constexpr std::size_t hashOfStem(std::string_view stem) {
  std::uint64_t hash = stem.size();
  while (!stem.empty()) {
    const std::size_t length = stem.size() < 8 ? stem.size() : 8;
    std::uint64_t word = 0;
    if (length == 8 && !std::is_constant_evaluated()) {
      std::memcpy(&word, stem.data(), 8);
    } else {
      for (std::size_t i = 0; i < length; ++i) {
        word |= std::uint64_t{static_cast<unsigned char>(stem[i])} << (8 * i);
      }
    }
    hash = (hash ^ word) * 0x9E3779B97F4A7C15U;
    hash ^= hash >> 32;
    stem.remove_prefix(length);
  }
  return static_cast<std::size_t>(hash);
}

}  // namespace vesprun
