#pragma once

#include <array>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <string>
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

/// Puts the parts together.
inline void assignFieldName(std::string& name, std::string_view stem, std::uint32_t number) {
  name = stem;
  if (number != FieldName::kNoNumber) {
    std::array<char, 10> digits;
    const auto [end, error] = std::to_chars(digits.data(), digits.data() + digits.size(), number);
    name.append(digits.data(), end);
  }
}

}  // namespace vesprun
