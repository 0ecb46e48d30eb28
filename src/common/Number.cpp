#include "common/Number.h"

#include <cmath>
#include <limits>

namespace vesprun {
namespace {

constexpr double kTwoTo63 = 9223372036854775808.0;
constexpr double kTwoTo64 = 18446744073709551616.0;

bool equalsInteger(double real, const Number& integer) {
  if (real != std::trunc(real)) {
    return false;
  }
  if (integer.isSigned() && integer.asInt64() < 0) {
    return real >= -kTwoTo63 && real < 0 && static_cast<std::int64_t>(real) == integer.asInt64();
  }
  return real >= 0 && real < kTwoTo64 && static_cast<std::uint64_t>(real) == integer.asUInt64();
}

}  // namespace

std::int64_t saturatingTruncate(double value) {
  if (std::isnan(value)) {
    return 0;
  }
  if (value >= kTwoTo63) {
    return std::numeric_limits<std::int64_t>::max();
  }
  if (value < -kTwoTo63) {
    return std::numeric_limits<std::int64_t>::min();
  }
  return static_cast<std::int64_t>(value);
}

std::int64_t Number::asInt64() const {
  return isFloatingPoint() ? saturatingTruncate(_real) : static_cast<std::int64_t>(_bits);
}

std::uint64_t Number::asUInt64() const {
  if (!isFloatingPoint()) {
    return _bits;
  }
  if (_real >= kTwoTo64) {
    return std::numeric_limits<std::uint64_t>::max();
  }
  // A negative fraction takes the bits of its signed reading, as a negative integer does.
  return _real >= 0 ? static_cast<std::uint64_t>(_real)
                    : static_cast<std::uint64_t>(saturatingTruncate(_real));
}

double Number::asDouble() const {
  if (isFloatingPoint()) {
    return _real;
  }
  return isSigned() ? static_cast<double>(static_cast<std::int64_t>(_bits))
                    : static_cast<double>(_bits);
}

bool operator==(const Number& left, const Number& right) {
  if (left.isFloatingPoint() && right.isFloatingPoint()) {
    return left._real == right._real;
  }
  if (left.isFloatingPoint()) {
    return equalsInteger(left._real, right);
  }
  if (right.isFloatingPoint()) {
    return equalsInteger(right._real, left);
  }
  const bool leftNegative = left.isSigned() && left.asInt64() < 0;
  const bool rightNegative = right.isSigned() && right.asInt64() < 0;
  return leftNegative == rightNegative && left._bits == right._bits;
}

}  // namespace vesprun
