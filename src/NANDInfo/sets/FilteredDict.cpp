#include "NANDInfo/sets/FilteredDict.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstddef>

namespace vesprun {
namespace {

constexpr std::array<std::uint64_t, 20> kPowersOfTen = [] {
  std::array<std::uint64_t, 20> powers{};
  std::uint64_t power = 1;
  for (std::uint64_t& entry : powers) {
    entry = power;
    power *= 10;
  }
  return powers;
}();

constexpr std::uint64_t kMaxCutDigits = 18;

/// The whole part of log10(x) in double precision, plus 1. Counting digits is faster and can only
/// differ near a power of ten.
std::uint64_t digitsOf(std::uint64_t x) {
  const auto least =
      static_cast<std::size_t>(std::bit_width(x)) * 1233 >> 12;  // 1233/4096: log10(2)
  const std::size_t digits = least + (x >= kPowersOfTen[least] ? 1 : 0);
  const std::uint64_t near = x >> 40;
  const bool belowNext = digits == kPowersOfTen.size() || x + near < kPowersOfTen[digits];
  return belowNext && x - near > kPowersOfTen[digits - 1]
             ? digits
             : static_cast<std::uint64_t>(std::log10(static_cast<double>(x))) + 1;
}

}  // namespace

std::uint64_t roundSig(std::uint64_t x, std::uint64_t sig) {
  if (x == 0) {
    return 0;
  }
  const std::uint64_t digits = digitsOf(x);
  if (digits <= sig) {
    return x;
  }
  const std::uint64_t cut = digits - sig;
  if (cut > kMaxCutDigits) {
    return 0;
  }
  const std::uint64_t power = kPowersOfTen[static_cast<std::size_t>(cut)];
  const std::uint64_t remainder = x % power;
  return (x / power + (remainder >= power / 2 ? 1 : 0)) * power;
}

PropertyDict CreateFilteredDict(const PropertyDict& source, const FieldTable* keys) {
  return CreateFilteredDict_SigDig(source, keys, false);
}

PropertyDict CreateFilteredDict_SigDig(const PropertyDict& source, const FieldTable* digits,
                                       bool round) {
  if (digits == nullptr) {
    return source;
  }
  PropertyDict filtered;
  filtered.reserve(std::min(source.size(), digits->size()));
  for (const auto& [key, value] : source) {
    const FieldRange* field = digits->find(key);
    if (field == nullptr) {
      continue;
    }
    const Number* number = round ? value.number() : nullptr;
    if (number != nullptr) {
      filtered.set(key, roundSig(number->asUInt64(), field->digits));
    } else {
      filtered.set(key, value);
    }
  }
  return filtered;
}

PropertyDict CreateFilteredDict_SigDig(const GenericParserCxt& source, const FieldTable* digits,
                                       bool round) {
  if (digits == nullptr || !round) {
    return CreateDictFromCxt(source, digits);
  }
  PropertyDict filtered;
  filtered.reserve(std::min(source.size(), digits->size()));
  source.forEach([&](const GenericParserCxt::Field& field) {
    if (const FieldRange* range = field.in(*digits)) {
      filtered.set(field.name, roundSig(field.value, range->digits));
    }
  });
  return filtered;
}

}  // namespace vesprun
