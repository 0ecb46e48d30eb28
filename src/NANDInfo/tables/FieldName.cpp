#include "NANDInfo/tables/FieldName.h"

#include <array>
#include <charconv>

namespace vesprun {

void assignFieldName(std::string& name, std::string_view stem, std::uint32_t number) {
  name = stem;
  if (number != FieldName::kNoNumber) {
    std::array<char, 10> digits;
    const auto [end, error] = std::to_chars(digits.data(), digits.data() + digits.size(), number);
    name.append(digits.data(), end);
  }
}

}  // namespace vesprun
