#include "platform/host/documents/NumberText.h"

#include <charconv>
#include <cstdint>
#include <limits>
#include <system_error>

namespace vesprun {
namespace {

template <typename T>
std::optional<T> parseWhole(std::string_view text) {
  T number = 0;
  const char* end = text.data() + text.size();
  const auto [stop, failure] = std::from_chars(text.data(), end, number);
  return failure == std::errc() && stop == end ? std::optional(number) : std::nullopt;
}

}  // namespace

std::optional<Number> parseInteger(std::string_view text) {
  if (const auto integer = parseWhole<std::int64_t>(text)) {
    return Number(*integer);
  }
  const auto large = parseWhole<std::uint64_t>(text);
  return large ? std::optional(Number(*large)) : std::nullopt;
}

std::optional<double> parseReal(std::string_view text) {
  if (text == "inf" || text == "-inf") {
    const double infinity = std::numeric_limits<double>::infinity();
    return text.front() == '-' ? -infinity : infinity;
  }
  if (text == "nan") {
    return std::numeric_limits<double>::quiet_NaN();
  }
  // from_chars would also accept names such as "infinity" and "nan(...)".
  if (text.find_first_not_of("0123456789.eE+-") != std::string_view::npos) {
    return std::nullopt;
  }
  return parseWhole<double>(text);
}

}  // namespace vesprun
