#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <string>
#include <string_view>

namespace vesprun {

/// The name of a statistics field, taken apart: "bandsMaxTempHisto_21" is the stem
/// "bandsMaxTempHisto_" and the number 21.
struct FieldName {
  static constexpr std::uint32_t kNoNumber = std::numeric_limits<std::uint32_t>::max();

  std::string_view stem;
  std::uint32_t number = kNoNumber;
};

/// Splits off the decimal number at the end of a name. A name has no number when it ends in no
/// digit, in more than nine of them, or in digits that begin with a needless zero; so each name is
/// split in one way, and putting the parts together gives the name again.
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

/// Sets `name` to the stem followed by the number, when it is one, in decimal.
void assignFieldName(std::string& name, std::string_view stem, std::uint32_t number);

}  // namespace vesprun
