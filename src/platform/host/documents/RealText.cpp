#include "platform/host/documents/RealText.h"

#include <charconv>
#include <limits>
#include <system_error>

namespace vesprun {

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
  double real = 0;
  const char* end = text.data() + text.size();
  const auto [stop, failure] = std::from_chars(text.data(), end, real);
  return failure == std::errc() && stop == end ? std::optional(real) : std::nullopt;
}

}  // namespace vesprun
