#pragma once

#include <charconv>
#include <string_view>
#include <system_error>

namespace vesprun {

/// False unless the whole text is a number in range: of an integer, decimal digits, with a minus or
/// without.
template <typename T>
bool parseWholeText(std::string_view text, T& value) {
  const auto [end, failure] = std::from_chars(text.data(), text.data() + text.size(), value);
  return failure == std::errc() && end == text.data() + text.size();
}

/// Takes "inf", "-inf" and "nan" as well.
inline bool parseWholeText(std::string_view text, double& value) {
  // The standard library also knows names such as "infinity" and "nan(...)".
  const bool isKnown = text == "inf" || text == "-inf" || text == "nan" ||
                       text.find_first_not_of("0123456789.eE+-") == std::string_view::npos;
  return isKnown && parseWholeText<double>(text, value);
}

}  // namespace vesprun
