#pragma once

#include <cmath>
#include <concepts>
#include <cstdint>
#include <limits>

namespace vesprun {

enum class NumberKind : std::uint8_t {
  Int8,
  Int16,
  Int32,
  Int64,
  UInt8,
  UInt16,
  UInt32,
  UInt64,
  Float,
  Double
};

namespace detail {

inline constexpr double kTwoTo63 = 9223372036854775808.0;
inline constexpr double kTwoTo64 = 18446744073709551616.0;

}  // namespace detail

/// Truncates toward zero, saturates at the ends of the range; NaN is 0.
inline std::int64_t saturatingTruncate(double value) {
  if (std::isnan(value)) {
    return 0;
  }
  if (value >= detail::kTwoTo63) {
    return std::numeric_limits<std::int64_t>::max();
  }
  if (value < -detail::kTwoTo63) {
    return std::numeric_limits<std::int64_t>::min();
  }
  return static_cast<std::int64_t>(value);
}

template <typename T>
concept NumberType = std::same_as<T, std::int8_t> || std::same_as<T, std::int16_t> ||
    std::same_as<T, std::int32_t> || std::same_as<T, std::int64_t> ||
    std::same_as<T, std::uint8_t> || std::same_as<T, std::uint16_t> ||
    std::same_as<T, std::uint32_t> || std::same_as<T, std::uint64_t> || std::same_as<T, float> ||
    std::same_as<T, double>;

/// A number that knows the C type it was made from.
///
/// Read as an integer, an integer keeps its low bits (two's complement); a fraction is truncated
/// toward zero, saturates at 64 bits and then keeps its low bits; NaN is 0. Any number can be read
/// as a double.
class Number {
 public:
  template <NumberType T>
  constexpr explicit Number(T value) : _kind(kindOf<T>()) {
    if constexpr (std::floating_point<T>) {
      _real = value;
    } else {
      // NOLINTNEXTLINE(bugprone-signed-char-misuse,cert-str34-c): the sign is to be extended
      _bits = static_cast<std::uint64_t>(value);
    }
  }

  constexpr NumberKind kind() const { return _kind; }
  constexpr bool isFloatingPoint() const {
    return _kind == NumberKind::Float || _kind == NumberKind::Double;
  }
  /// Fractions are neither signed nor unsigned.
  constexpr bool isSigned() const { return _kind <= NumberKind::Int64; }

  std::int64_t asInt64() const;
  std::uint64_t asUInt64() const;
  std::int32_t asInt32() const { return static_cast<std::int32_t>(asInt64()); }
  std::uint32_t asUInt32() const { return static_cast<std::uint32_t>(asUInt64()); }
  double asDouble() const;

  /// Equal in mathematical value, whatever the kinds. NaN equals nothing.
  friend bool operator==(const Number& left, const Number& right);

 private:
  template <NumberType T>
  static constexpr NumberKind kindOf() {
    if constexpr (std::same_as<T, float>) {
      return NumberKind::Float;
    } else if constexpr (std::same_as<T, double>) {
      return NumberKind::Double;
    } else {
      constexpr int widthIndex = sizeof(T) == 1 ? 0 : sizeof(T) == 2 ? 1 : sizeof(T) == 4 ? 2 : 3;
      return static_cast<NumberKind>(std::signed_integral<T> ? widthIndex : widthIndex + 4);
    }
  }

  static bool equalsInteger(double real, const Number& integer) {
    if (real != std::trunc(real)) {
      return false;
    }
    if (integer.isSigned() && integer.asInt64() < 0) {
      return real >= -detail::kTwoTo63 && real < 0 &&
             static_cast<std::int64_t>(real) == integer.asInt64();
    }
    return real >= 0 && real < detail::kTwoTo64 &&
           static_cast<std::uint64_t>(real) == integer.asUInt64();
  }

  union {
    std::uint64_t _bits;  ///< integers, sign- or zero-extended
    double _real;         ///< fractions; a float widens exactly
  };
  NumberKind _kind;
};

inline std::int64_t Number::asInt64() const {
  return isFloatingPoint() ? saturatingTruncate(_real) : static_cast<std::int64_t>(_bits);
}

inline std::uint64_t Number::asUInt64() const {
  if (!isFloatingPoint()) {
    return _bits;
  }
  if (_real >= detail::kTwoTo64) {
    return std::numeric_limits<std::uint64_t>::max();
  }
  // As for negative integers: the bits of the signed reading.
  return _real >= 0 ? static_cast<std::uint64_t>(_real)
                    : static_cast<std::uint64_t>(saturatingTruncate(_real));
}

inline double Number::asDouble() const {
  if (isFloatingPoint()) {
    return _real;
  }
  return isSigned() ? static_cast<double>(static_cast<std::int64_t>(_bits))
                    : static_cast<double>(_bits);
}

inline bool operator==(const Number& left, const Number& right) {
  if (left.isFloatingPoint() && right.isFloatingPoint()) {
    return left._real == right._real;
  }
  if (left.isFloatingPoint()) {
    return Number::equalsInteger(left._real, right);
  }
  if (right.isFloatingPoint()) {
    return Number::equalsInteger(right._real, left);
  }
  const bool leftNegative = left.isSigned() && left.asInt64() < 0;
  const bool rightNegative = right.isSigned() && right.asInt64() < 0;
  return leftNegative == rightNegative && left._bits == right._bits;
}

}  // namespace vesprun
