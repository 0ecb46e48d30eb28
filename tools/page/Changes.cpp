#include "page/Changes.h"

#include <algorithm>
#include <cmath>

namespace vesprun {
namespace {

constexpr std::size_t kDaysBefore = 28;
constexpr int kWeek = 7;
constexpr double kDeviationOfMedianDeviation = 1.4826;  // of a normal distribution
constexpr double kDeviationOfMeanDeviation = 1.2533;

struct Middle {
  double median;
  double spread;  ///< a standard deviation, were the values normally distributed
};

Middle middleOf(const std::vector<double>& values) {
  const double median = medianOf(values);
  std::vector<double> deviations;
  double sum = 0;
  for (const double value : values) {
    deviations.push_back(std::abs(value - median));
    sum += deviations.back();
  }
  // More than half of the values are equal: the others still say how far it goes.
  const double spread = kDeviationOfMedianDeviation * medianOf(deviations);
  return {median, spread > 0
                      ? spread
                      : kDeviationOfMeanDeviation * sum / static_cast<double>(values.size())};
}

/// How far from the middle a value is, as a multiple of the spread.
double distance(double value, const std::vector<double>& values, double minSpread) {
  const Middle middle = middleOf(values);
  return std::abs(value - middle.median) / std::max(middle.spread, minSpread);
}

/// What a step of rounding makes of the spread: whitelists let many figures through with two
/// digits.
double spreadOfRounding(double last, const std::vector<double>& values, double median) {
  constexpr double kStepsToSee = 4;
  double step = 1;
  const auto isMultiple = [&step](double value) { return std::fmod(value, step * 10) == 0; };
  while (step < std::abs(median) / 10 && isMultiple(last) &&
         std::ranges::all_of(values, isMultiple)) {
    step *= 10;
  }
  return step > 1 && step <= std::abs(median) / 10 ? step / kStepsToSee : 0;
}

double constantsScore(double value, double constant, bool areWhole, double minSpread) {
  const double step = std::max({0.005 * std::abs(constant), minSpread,
                                areWhole || constant == 0 ? 0.125 : 1e-6 * std::abs(constant)});
  const double score = std::abs(value - constant) / step;
  return minSpread > 0 ? score : std::max(score, kMinUnusualScore + 1);
}

/// Counts scatter by their root at least; many figures scatter by a share of themselves.
double scatteredScore(double value, const std::vector<double>& values, bool areWhole,
                      double minSpread) {
  const double median = std::abs(medianOf(values));
  const double ofCount = areWhole ? std::max(0.5, 0.5 * std::sqrt(median)) : 0;
  const double direct =
      distance(value, values, std::max({ofCount, minSpread, 0.01 * median, 1e-12}));
  std::vector<double> shares;
  const bool arePositive = value > 0 && *std::ranges::min_element(values) > 0;
  const auto share = [arePositive](double number) {
    return arePositive ? std::log(number) : std::copysign(std::sqrt(std::abs(number)), number);
  };
  std::ranges::transform(values, std::back_inserter(shares), share);
  const double minShare = !areWhole     ? 0.01
                          : arePositive ? std::max(0.01, 0.5 / std::sqrt(std::max(median, 1.0)))
                                        : 0.5;
  return std::min(direct, distance(share(value), shares, minShare));
}

}  // namespace

double medianOf(std::vector<double> values) {
  if (values.empty()) {
    return 0;
  }
  const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
  std::nth_element(values.begin(), middle, values.end());
  if (values.size() % 2 == 1) {
    return *middle;
  }
  return *std::max_element(values.begin(), middle) / 2 + *middle / 2;
}

std::optional<Unusual> unusualLast(std::span<const DayValue> all) {
  if (all.size() < kMinDaysBefore + 1) {
    return std::nullopt;
  }
  const DayValue& last = all.back();
  std::vector<double> values;
  std::vector<double> ofWeekday;
  bool areWhole = last.value == std::trunc(last.value);
  std::size_t asFar = 0;
  const std::size_t first = all.size() - 1 - std::min(all.size() - 1, kDaysBefore);
  for (const DayValue& other : all.subspan(first, all.size() - 1 - first)) {
    values.push_back(other.value);
    areWhole = areWhole && other.value == std::trunc(other.value);
    if ((last.day - other.day) % kWeek == 0) {
      ofWeekday.push_back(other.value);
    }
  }
  const auto [lowest, highest] = std::ranges::minmax(values);
  Unusual result{0,      last.day, last.value, all[all.size() - 2].value, medianOf(values),
                 lowest, highest};
  const double minSpread = spreadOfRounding(last.value, values, result.usual);
  if (lowest == highest) {
    result.score =
        last.value == lowest ? 0 : constantsScore(last.value, lowest, areWhole, minSpread);
    return result;
  }
  // An outage that goes on stays listed for some days; what has been so before is not.
  constexpr std::size_t kGoesOn = 3;
  for (std::size_t i = 0; i + kGoesOn < values.size(); ++i) {
    const bool isAsFar =
        last.value >= result.usual ? values[i] >= last.value : values[i] <= last.value;
    asFar += isAsFar ? 1 : 0;
  }
  const bool isLarge = std::abs(last.value - result.usual) >= std::abs(result.usual);
  if (asFar > (isLarge ? 1 : 0)) {
    return result;
  }
  result.score = scatteredScore(last.value, values, areWhole, minSpread);
  constexpr std::size_t kMinWeeks = 3;
  if (ofWeekday.size() >= kMinWeeks) {
    const double spread =
        std::max({middleOf(values).spread, minSpread, 0.01 * std::abs(result.usual)});
    const double distance = std::abs(last.value - medianOf(ofWeekday));
    result.score = std::min(result.score, distance / std::max(spread, areWhole ? 0.5 : 1e-12));
  }
  return result;
}

std::optional<Drift> driftOf(std::span<const DayValue> all) {
  constexpr std::size_t kMinDays = 21;
  constexpr std::size_t kMaxDays = 60;
  constexpr double kMinShare = 0.1;
  constexpr double kMinCounts = 3;
  constexpr double kMinScatters = 2;
  constexpr double kMinDeviations = 4.5;
  if (all.size() < kMinDays) {
    return std::nullopt;
  }
  const auto days = all.last(std::min(all.size(), kMaxDays));
  const std::size_t count = days.size();
  const auto medianOfWeek = [&days](std::size_t from) {
    std::vector<double> week;
    for (const DayValue& day : days.subspan(from, kWeek)) {
      week.push_back(day.value);
    }
    return medianOf(week);
  };
  Drift drift{0, days.front().day, medianOfWeek(0), medianOfWeek(count - kWeek)};
  const double step = std::abs(drift.to - drift.from);
  const double size = std::max(std::abs(drift.from), std::abs(drift.to));
  const bool areWhole = drift.from == std::trunc(drift.from) && drift.to == std::trunc(drift.to);
  if (step < kMinShare * size || step == 0 || (areWhole && step < kMinCounts)) {
    return std::nullopt;
  }
  double ordered = 0;
  // What is left beside the middle of the days around, as many on either side, and how much a day
  // has of the one before it.
  std::vector<double> rest;
  double mean = 0;
  for (std::size_t i = 0; i < count; ++i) {
    for (std::size_t j = i + 1; j < count; ++j) {
      ordered += days[j].value > days[i].value ? 1 : days[j].value < days[i].value ? -1 : 0;
    }
    std::vector<double> around;
    const std::size_t reach = std::min({std::size_t{kWeek}, i, count - 1 - i});
    for (std::size_t j = i - reach; j <= i + reach; ++j) {
      around.push_back(days[j].value);
    }
    rest.push_back(days[i].value - medianOf(around));
    mean += rest.back() / static_cast<double>(count);
  }
  double squares = 0;
  double products = 0;
  for (std::size_t i = 0; i < count; ++i) {
    squares += (rest[i] - mean) * (rest[i] - mean);
    products += i > 0 ? (rest[i] - mean) * (rest[i - 1] - mean) : 0;
  }
  const double kept = squares > 0 ? std::clamp(products / squares, 0.0, 0.9) : 0;
  const auto n = static_cast<double>(count);
  const double deviation = std::sqrt(n * (n - 1) * (2 * n + 5) / 18 * (1 + kept) / (1 - kept));
  // It must also be more than days differ by.
  const double scatter = std::sqrt(squares / n);
  drift.score = std::abs(ordered) / deviation;
  const bool isSeen = drift.score >= kMinDeviations && step >= kMinScatters * scatter &&
                      (ordered > 0) == (drift.to > drift.from);
  return isSeen ? std::optional(drift) : std::nullopt;
}

std::vector<DayValue> growthOf(std::span<const DayValue> values) {
  std::vector<DayValue> growth;
  for (std::size_t i = 1; i < values.size(); ++i) {
    growth.push_back({values[i].day, (values[i].value - values[i - 1].value) /
                                         (values[i].day - values[i - 1].day)});
  }
  return growth;
}

}  // namespace vesprun
