#include "page/DeviceKeys.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "page/Quantity.h"

namespace vesprun {
namespace {

constexpr std::int32_t kMaxDays = 400;  // that a picture shows
constexpr std::size_t kDaysOfWeek = 7;
constexpr std::size_t kDaysToBeRegular = 5;
constexpr std::size_t kNewestDays = 28;

std::string rangeText(const Unusual& unusual, Unit unit) {
  std::string text;
  if (unusual.before) {
    text = quantity(*unusual.before, unit) + " the day before, ";
  }
  text += "usually " + quantity(unusual.usual, unit);
  return unusual.lowest == unusual.highest ? text
                                           : text + " (" + quantity(unusual.lowest, unit) + " to " +
                                                 quantity(unusual.highest, unit) + ")";
}

/// The line of an item in the list of changes.
Element changeLine(const std::vector<DayValue>& values, Period period) {
  return sparkline(pointsOf(values), period, 1, "its days");
}

std::string wordsOrKey(const KeyWords& words, std::string_view key) {
  if (!words.words.empty()) {
    return words.words;
  }
  const std::size_t dot = key.rfind('.');
  return std::string(dot == std::string_view::npos || dot + 1 == key.size() ? key
                                                                            : key.substr(dot + 1));
}

}  // namespace

PageDays::PageDays(const PageData& data, std::int32_t today) {
  for (const auto& [day, log] : data.days) {
    (day <= today ? reported : toCome).push_back(day);
  }
  if (reported.empty()) {
    std::swap(reported, toCome);
  }
  if (!reported.empty()) {
    const std::int64_t first = std::int64_t{reported.back()} - kMaxDays + 1;
    period = {static_cast<double>(*std::ranges::lower_bound(reported, first)),
              static_cast<double>(reported.back())};
  }
}

bool isUnknown(const Number& value) {
  return !value.isFloatingPoint() &&
         (value.asInt64() == -1 || value.asUInt64() == std::numeric_limits<std::uint32_t>::max());
}

std::vector<DayValue> knownValues(const PageData::Series& series, const PageDays& days) {
  const bool hasNegatives =
      std::ranges::any_of(series, [](const auto& value) { return value.value.asDouble() < -1; });
  std::vector<DayValue> known;
  for (const auto& [day, value] : series) {
    if (day >= days.period.first && day <= days.period.last && std::isfinite(value.asDouble()) &&
        (!isUnknown(value) || hasNegatives)) {
      known.push_back({static_cast<std::int32_t>(day), value.asDouble()});
    }
  }
  return known;
}

KeySeries seriesOf(const PageData::Series& series, const PageDays& days) {
  return {"", knownValues(series, days)};
}

std::vector<KeySeries> seriesOf(const std::vector<PageData::DistributionDay>& distribution,
                                const PageDays& days) {
  // Ends scatter more than means, and more of them are judged.
  constexpr double kMinScoreOfEnds = 8;
  std::vector<KeySeries> all{{"mean", {}},
                             {"highest", {}, kMinScoreOfEnds},
                             {"lowest", {}, kMinScoreOfEnds},
                             {"number of values", {}, kMinScoreOfEnds}};
  for (const PageData::DistributionDay& day : distribution) {
    const double values[] = {day.mean, day.maximum, day.minimum, day.count.asDouble()};
    if (day.day < days.period.first || day.day > days.period.last || day.count.asInt64() <= 0) {
      continue;
    }
    for (std::size_t i = 0; i < all.size(); ++i) {
      if (std::isfinite(values[i])) {
        all[i].values.push_back({day.day, values[i]});
      }
    }
  }
  return all;
}

std::vector<Point> pointsOf(const std::vector<DayValue>& values) {
  std::vector<Point> points;
  points.reserve(values.size());
  for (const DayValue& value : values) {
    points.push_back({static_cast<double>(value.day), value.value});
  }
  return points;
}

KeyChanges::KeyChanges(const PageData& data, const PageDays& days) : _days(days) {
  if (days.isEmpty()) {
    return;
  }
  for (const auto& [key, series] : data.scalars) {
    judge(key, {seriesOf(series, days)});
  }
  for (const auto& [key, distribution] : data.distributions) {
    judge(key, seriesOf(distribution, days));
  }
  addPresences(_gone, "gone", " keys are gone");
  addPresences(_new, "new", " keys are new");
}

ChangeItem KeyChanges::itemOf(std::string_view key, const KeySeries& series,
                              const Unusual& unusual) const {
  const KeyWords words = wordsOf(key);
  const bool isCount = series.aspect == "number of values";
  const Unit unit = isCount ? Unit::None : words.unit;
  std::string what = wordsOrKey(words, key);
  if (words.isRunningTotal) {
    what += ", growth of the day";
  } else if (!series.aspect.empty()) {
    what += ", " + std::string(series.aspect);
  }
  ChangeItem item{unusual.score,    ChangeItem::Level::Look,       std::move(what),
                  std::string(key), quantity(unusual.value, unit), rangeText(unusual, unit)};
  item.line = changeLine(series.values, _days.period);
  return item;
}

void KeyChanges::judge(std::string_view key, const std::vector<KeySeries>& all) {
  judgePresence(key, all.front().values);
  if (!_days.areEnough()) {
    return;
  }
  const KeyWords words = wordsOf(key);
  std::optional<ChangeItem> best;
  std::optional<ChangeItem> bestEarlier;
  for (const KeySeries& series : all) {
    const std::vector<DayValue> judged =
        words.isRunningTotal ? growthOf(series.values) : series.values;
    const std::span<const DayValue> values(judged);
    for (std::size_t back = 0; back < std::min(kDaysOfWeek, values.size()); ++back) {
      const auto unusual = unusualLast(values.first(values.size() - back));
      if (!unusual || unusual->day + static_cast<std::int32_t>(kDaysOfWeek) <= _days.newest()) {
        break;
      }
      const bool isToday = unusual->day == _days.newest();
      const double least = series.minScore + (isToday ? 0 : 2);
      std::optional<ChangeItem>& place = isToday ? best : bestEarlier;
      if (unusual->score >= least && (!place || place->rank < unusual->score)) {
        place = itemOf(key, series, *unusual);
        if (!isToday) {
          place->what = dayText(unusual->day) + ": " + place->what;
        }
      }
    }
  }
  // A total's growth is judged above; it always goes one way itself.
  const auto drift = words.isRunningTotal ? std::nullopt : driftOf(all.front().values);
  const bool isCurrent =
      !all.front().values.empty() && all.front().values.back().day == _days.newest();
  if (!best && drift && isCurrent) {
    constexpr double kDriftsRank = 2;
    best = ChangeItem{
        kDriftsRank * drift->score,
        ChangeItem::Level::Look,
        wordsOrKey(words, key) + ", slowly " + (drift->to > drift->from ? "rising" : "falling"),
        std::string(key),
        quantity(drift->to, words.unit),
        quantity(drift->from, words.unit) + " in the week from " + dayText(drift->since)};
    best->line = changeLine(all.front().values, _days.period);
  }
  if (best) {
    _unusual[key] = best->rank;
    today.push_back(std::move(*best));
  } else if (bestEarlier) {
    _unusual[key] = bestEarlier->rank;
    earlier.push_back(std::move(*bestEarlier));
  }
}

void KeyChanges::judgePresence(std::string_view key, const std::vector<DayValue>& values) {
  if (values.empty() || !_days.areEnough()) {
    return;
  }
  const KeyWords words = wordsOf(key);
  const auto item = [&](std::string then, const char* now) {
    ChangeItem made{0,   ChangeItem::Level::Look, wordsOrKey(words, key), std::string(key),
                    now, std::move(then)};
    made.line = changeLine(values, _days.period);
    return made;
  };
  if (values.front().day == _days.newest()) {
    _new.push_back(item(quantity(values.back().value, words.unit) + ", never before", "new"));
    return;
  }
  // Where the key's last day stands among the reported days, and how long it was there every day.
  const auto last = std::ranges::lower_bound(_days.reported, values.back().day);
  const auto since = static_cast<std::size_t>(_days.reported.end() - last) - 1;
  if (since == 0 || since > kDaysOfWeek) {
    return;
  }
  std::size_t run = 0;
  while (run < values.size() && run <= static_cast<std::size_t>(last - _days.reported.begin()) &&
         values[values.size() - 1 - run].day == *(last - static_cast<std::ptrdiff_t>(run))) {
    ++run;
  }
  const bool isRegular = run >= std::min(kNewestDays, values.size()) && run >= kDaysToBeRegular;
  if (isRegular) {
    _gone.push_back(item(
        "last " + dayText(values.back().day) + ": " + quantity(values.back().value, words.unit),
        "gone"));
  }
}

void KeyChanges::addPresences(std::vector<ChangeItem>& presences, const char* one,
                              const char* many) {
  constexpr std::size_t kMaxAlone = 3;
  constexpr double kRankOfPresence = 5e8;
  if (presences.size() > kMaxAlone) {
    std::string names;
    for (std::size_t i = 0; i < kMaxAlone; ++i) {
      names += (i > 0 ? ", " : "") + cutInTheMiddle(presences[i].key, 80);
    }
    today.push_back({kRankOfPresence, ChangeItem::Level::Look, numeral(presences.size()) + many, "",
                     one, names + " and " + numeral(presences.size() - kMaxAlone) + " more"});
    return;
  }
  for (ChangeItem& item : presences) {
    item.rank = kRankOfPresence;
    today.push_back(std::move(item));
  }
}

}  // namespace vesprun
