#include "listen/StatsdLine.h"

#include <cmath>
#include <limits>

#include "platform/host/documents/NumberText.h"

namespace vesprun {
namespace {

/// Takes what stands before `separator`, and the separator, off the text.
std::string_view takeUntil(std::string_view& text, char separator) {
  const std::size_t end = text.find(separator);
  const std::string_view taken = text.substr(0, end);
  text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
  return taken;
}

template <typename T>
bool parseSigned(std::string_view text, T& value) {
  if (text.size() > 1 && text[0] == '+' && text[1] != '-') {
    text.remove_prefix(1);
  }
  return parseWholeText(text, value);
}

/// A sampling rate as an exact fraction, so that 1 in 0.4 is 2.5 and rounds up.
struct Rate {
  std::int64_t numerator = 1;
  std::int64_t denominator = 1;
};

constexpr int kMaxFractionDigits = 17;

/// A decimal number above 0, at most 1; digits after the 17th are below what a sender can mean.
bool parseRate(std::string_view text, Rate& rate) {
  double value = 0;
  if (!parseWholeText(text, value) || !(value > 0 && value <= 1)) {
    return false;
  }
  const std::size_t point = text.find('.');
  const std::string_view fraction =
      point == std::string_view::npos ? std::string_view() : text.substr(point + 1);
  if (value == 1) {
    rate = {};
  } else if (fraction.size() <= kMaxFractionDigits &&
             text.find_first_of("eE") == std::string_view::npos &&
             parseWholeText(fraction, rate.numerator)) {
    for (std::size_t digits = 0; digits < fraction.size(); ++digits) {
      rate.denominator *= 10;
    }
  } else {
    rate.denominator = 100'000'000'000'000'000;
    rate.numerator = std::llround(value * static_cast<double>(rate.denominator));
  }
  return rate.numerator > 0;
}

/// Halves away from zero. False beyond 64 bits.
bool divide(std::int64_t& value, const Rate& rate) {
  __extension__ using Wide = __int128;  // below 2^63 times 10^17
  const Wide product = static_cast<Wide>(value) * rate.denominator;
  const Wide half = rate.numerator / 2;
  const Wide quotient = (product < 0 ? product - half : product + half) / rate.numerator;
  if (quotient < std::numeric_limits<std::int64_t>::min() ||
      quotient > std::numeric_limits<std::int64_t>::max()) {
    return false;
  }
  value = static_cast<std::int64_t>(quotient);
  return true;
}

template <typename T>
bool parseValues(std::string_view text, std::vector<T>& values) {
  bool isWhole = !text.empty() && text.back() != ':';
  while (isWhole && !text.empty()) {
    T value{};
    isWhole = parseSigned(takeUntil(text, ':'), value) && std::isfinite(static_cast<double>(value));
    values.push_back(value);
  }
  return isWhole;
}

}  // namespace

std::optional<DropReason> parseStatsdLine(std::string_view line, StatsdLine& parsed) {
  parsed.integers.clear();
  parsed.numbers.clear();
  if (line.find(':') == std::string_view::npos || line.ends_with('|')) {
    return DropReason::Form;
  }
  parsed.key = takeUntil(line, ':');
  const std::string_view values = takeUntil(line, '|');
  const std::string_view type = takeUntil(line, '|');

  Rate rate;
  bool hasRate = false;
  bool hasTags = false;
  while (!line.empty()) {
    const std::string_view section = takeUntil(line, '|');
    if (section.starts_with('#') && !hasTags) {
      hasTags = true;
    } else if (section.starts_with('@') && !hasRate && parseRate(section.substr(1), rate)) {
      hasRate = true;
    } else {
      return DropReason::Form;
    }
  }

  bool isWhole = !parsed.key.empty() && parsed.key.find('|') == std::string_view::npos;
  if (type == "s") {
    isWhole = isWhole && !values.empty();
    hasTags = true;  // as little a kind of counter as tags are
  } else if (type == "c" || type == "g") {
    parsed.change = type == "c" ? StatsdLine::Change::Add : StatsdLine::Change::Set;
    isWhole = isWhole && (type == "c" || !hasRate) && parseValues(values, parsed.integers);
  } else if (type == "ms" || type == "h" || type == "d") {
    parsed.change = StatsdLine::Change::Append;
    isWhole = isWhole && !hasRate && parseValues(values, parsed.numbers);
  } else {
    isWhole = false;
  }
  for (std::int64_t& value : parsed.integers) {
    isWhole = isWhole && divide(value, rate);
  }
  return !isWhole  ? std::optional(DropReason::Form)
         : hasTags ? std::optional(DropReason::Kind)
                   : std::nullopt;
}

}  // namespace vesprun
