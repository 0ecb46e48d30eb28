#include "report/RoundScalar.h"

#include <cmath>
#include <limits>

namespace vesprun {
namespace {

std::int64_t roundToBucket(std::int64_t value, std::uint64_t interval) {
  if (interval == 0) {
    return 0;
  }
  const std::uint64_t raised = static_cast<std::uint64_t>(value) + interval / 2;
  return static_cast<std::int64_t>(raised / interval * interval);
}

std::int64_t roundToDigits(std::int64_t value, std::uint64_t digits) {
  if (value == 0 || value == std::numeric_limits<std::int64_t>::min()) {
    return value;
  }
  const auto magnitude = static_cast<double>(value < 0 ? -value : value);
  const auto length = static_cast<std::uint64_t>(std::ceil(std::log10(magnitude)));
  const auto excess = static_cast<std::int64_t>(length - digits);
  if (excess < 1) {
    return value;
  }
  const double power = std::pow(10.0, static_cast<double>(excess));
  return saturatingTruncate(power * std::round(static_cast<double>(value) / power));
}

}  // namespace

std::int64_t roundScalar(std::int64_t value, const ScalarOptions& options) {
  if (options.bucketInterval) {
    value = roundToBucket(value, *options.bucketInterval);
  }
  return options.significantDigits ? roundToDigits(value, *options.significantDigits) : value;
}

}  // namespace vesprun
