#include <algorithm>
#include <charconv>
#include <cmath>

#include "common/TextForm.h"
#include "page/Quantity.h"
#include "page/Sections.h"

namespace vesprun {
namespace {

constexpr std::size_t kMaxValues = 400;  // listed for one key

Element tab() { return Element::constant("\t"); }
Element lineEnd() { return Element::constant("\n"); }

/// The median of the 28 days before the newest.
std::string usualText(const std::vector<DayValue>& values, Unit unit) {
  constexpr std::size_t kDays = 28;
  if (values.size() < 2) {
    return "";
  }
  std::vector<double> before;
  for (std::size_t i = values.size() - 1 - std::min(kDays, values.size() - 1);
       i + 1 < values.size(); ++i) {
    before.push_back(values[i].value);
  }
  return quantity(medianOf(before), unit);
}

std::string endedText(double day, const PageDays& days) {
  return day < days.newest() ? momentText(day) : "";
}

/// Each value of a scalar, exactly: a line for each week, or each value where days are missing.
Element valueList(const PageData::Series& series) {
  Element list("pre", {});
  const std::size_t first = series.size() - std::min(series.size(), kMaxValues);
  for (std::size_t i = first; i < series.size(); ++i) {
    const bool goesOn = i > first && series[i].day == series[i - 1].day + 1 && (i - first) % 7 != 0;
    if (!goesOn) {
      list.add(i > first ? lineEnd() : Element()).add(momentText(series[i].day));
    }
    list.add(tab()).add(numeral(series[i].value));
  }
  return list;
}

KeyCourse scalarCourse(std::string_view key, const PageData::Series& series, const PageDays& days,
                       bool isDetailed) {
  const KeyWords words = wordsOf(key);
  const std::vector<DayValue> known = knownValues(series, days);
  KeyCourse course{key, words.words};
  course.line = pointsOf(known);
  const bool isNewestKnown = !known.empty() && known.back().day == series.back().day;
  course.newest = isNewestKnown ? quantity(known.back().value, words.unit) : "unknown";
  course.ended = endedText(series.back().day, days);
  if (!known.empty()) {
    const auto [low, high] = std::ranges::minmax_element(known, {}, &DayValue::value);
    course.lowest = quantity(low->value, words.unit);
    course.highest = quantity(high->value, words.unit);
    course.usual = isDetailed ? usualText(known, words.unit) : "";
  }
  if (isDetailed) {
    course.details = valueList(series);
  }
  return course;
}

double deviation(const PageData::DistributionDay& day) {
  const double count = day.count.asDouble();
  return count > 0 ? std::sqrt(day.squaredDeviations / count) : 0;
}

/// Lowest, mean and highest value of each day.
Element bandFigure(const std::vector<BandPoint>& points, const PageDays& days, Unit unit) {
  if (points.empty()) {
    return {};
  }
  const auto [low, high] = scaleOf(points);
  const auto ends = [](std::string left, std::string right) {
    return Element("p", {{"class", "ends"}}, Element("span", {}, std::move(left)),
                   Element("span", {}, std::move(right)));
  };
  return {"figure",
          {},
          Element("figcaption", {},
                  std::string("Lowest, mean and highest of each day") +
                      (isLogarithmic(points) ? ", logarithmic" : "")),
          ends(quantity(high, unit), ""),
          bandChart(points, days.period,
                    countedNoun(points.size(), "day") + " from " + quantity(low, unit) + " to " +
                        quantity(high, unit)),
          ends(quantity(low, unit), ""),
          ends(momentText(days.period.first), momentText(days.period.last))};
}

struct Bucket {
  std::string_view label;
  double newest = 0;  ///< count on the newest day with a histogram
  double all = 0;     ///< on all days together
};

/// The lower boundary in a label "(1, 10]", by which buckets are ordered.
double lowerBoundary(std::string_view label) {
  double boundary = HUGE_VAL;
  if (label.starts_with('(')) {
    std::from_chars(label.data() + 1, label.data() + label.size(), boundary);
  }
  return std::isnan(boundary) ? HUGE_VAL : boundary;
}

/// The buckets of all days. An empty bucket is in no histogram, so each day may know others.
std::vector<Bucket> bucketsOf(const std::vector<PageData::DistributionDay>& days,
                              std::int32_t& newestDay) {
  std::vector<Bucket> buckets;
  std::map<std::string_view, std::size_t> known;
  bool isNewest = true;
  for (auto day = days.rbegin(); day != days.rend(); ++day) {
    if (day->histogram == nullptr) {
      continue;
    }
    for (const auto& [label, value] : *day->histogram) {
      const double count = std::max(value.number()->asDouble(), 0.0);
      const auto [place, isNew] = known.try_emplace(label, buckets.size());
      if (isNew) {
        buckets.push_back({label, 0, 0});
      }
      buckets[place->second].newest += isNewest ? count : 0;
      buckets[place->second].all += count;
    }
    newestDay = isNewest ? day->day : newestDay;
    isNewest = false;
  }
  std::ranges::stable_sort(buckets, {},
                           [](const Bucket& bucket) { return lowerBoundary(bucket.label); });
  return buckets;
}

std::string nameOfUnit(Unit unit) {
  const std::string one = quantity(1, unit);
  const std::size_t space = one.find("\u202F");
  return space == std::string::npos ? "" : " in " + one.substr(space + 3);
}

Element histogramFigure(const std::vector<PageData::DistributionDay>& days, Unit unit) {
  std::int32_t newestDay = 0;
  const std::vector<Bucket> buckets = bucketsOf(days, newestDay);
  if (buckets.empty()) {
    return {"figure", {}, Element("figcaption", {}, "No histogram is reported")};
  }
  double newest = 0;
  double all = 0;
  for (const Bucket& bucket : buckets) {
    newest += bucket.newest;
    all += bucket.all;
  }
  const auto share = [](double count, double sum) { return sum > 0 ? count / sum : 0; };
  double longest = 0;
  for (const Bucket& bucket : buckets) {
    longest = std::max({longest, share(bucket.newest, newest), share(bucket.all, all)});
  }
  Element caption("figcaption", {}, "Values" + nameOfUnit(unit) + " of " + dayText(newestDay));
  if (days.size() > 1) {
    caption.add("; ").add(Element("i", {{"class", "mark"}})).add(" share over all days");
  }
  Element table("table", {{"class", "histogram"}});
  for (const Bucket& bucket : buckets) {
    table.add({"tr",
               {},
               rowHead(foldedName(bucket.label)),
               Element("td", {},
                       bar(share(share(bucket.newest, newest), longest),
                           days.size() > 1 ? share(share(bucket.all, all), longest) : 0)),
               cell(numeral(bucket.newest))});
  }
  return {"figure", {}, std::move(caption), std::move(table)};
}

Element dayByDay(const std::vector<PageData::DistributionDay>& days) {
  Element list("pre", {}, Element::constant("day\tvalues\tlowest\tmean\thighest\tdeviation"));
  for (const PageData::DistributionDay& day : days) {
    list.add(lineEnd()).add(dayText(day.day)).add(tab()).add(textForm(day.count));
    for (const double value : {day.minimum, day.mean, day.maximum, deviation(day)}) {
      list.add(tab()).add(numeral(value));
    }
  }
  return folded("Day by day", std::move(list));
}

KeyCourse distributionCourse(std::string_view key,
                             const std::vector<PageData::DistributionDay>& distribution,
                             const PageDays& days, bool isDetailed) {
  const KeyWords words = wordsOf(key);
  KeyCourse course{key, words.words.empty() ? "mean of each day" : words.words + ", mean"};
  const std::vector<KeySeries> all = seriesOf(distribution, days);
  course.line = pointsOf(all.front().values);
  const PageData::DistributionDay& newest = distribution.back();
  course.newest = quantity(newest.mean, words.unit);
  course.ended = endedText(newest.day, days);
  std::vector<BandPoint> points;
  double low = HUGE_VAL;
  double high = -HUGE_VAL;
  for (const PageData::DistributionDay& day : distribution) {
    if (day.count.asInt64() > 0 && std::isfinite(day.minimum) && std::isfinite(day.mean) &&
        std::isfinite(day.maximum)) {
      points.push_back({static_cast<double>(day.day), day.minimum, day.mean, day.maximum});
      low = std::min(low, day.minimum);
      high = std::max(high, day.maximum);
    }
  }
  if (!points.empty()) {
    course.lowest = quantity(low, words.unit);
    course.highest = quantity(high, words.unit);
  }
  if (isDetailed) {
    course.usual = usualText(all.front().values, words.unit);
    course.details = std::vector<Element>{
        Element("p", {},
                dayText(newest.day) + ": " + numeral(newest.count) +
                    (newest.count.asInt64() == 1 ? " value from " : " values from ") +
                    quantity(newest.minimum, words.unit) + " to " +
                    quantity(newest.maximum, words.unit) + ", standard deviation " +
                    quantity(deviation(newest), words.unit)),
        Element("div", {{"class", "pair"}}, histogramFigure(distribution, words.unit),
                bandFigure(points, days, words.unit)),
        dayByDay(distribution)};
  }
  return course;
}

}  // namespace

void addKeys(Document& document, const PageData& data, const PageDays& days,
             const KeyChanges& changes, const KeyTable& table) {
  document.beginSection("keys", "Keys");
  if (data.scalars.empty() && data.distributions.empty()) {
    document.add({"p", {}, "No key has been reported."});
    return document.endSection();
  }
  document.add({"p",
                {{"class", "key"}},
                "All lines are over " +
                    daysText(static_cast<std::int32_t>(days.period.first), days.newest()) +
                    " and their scale begins at 0; “usual” is the median of the 28 days before "
                    "the newest. ",
                Element("i", {}),
                "start of the system ",
                Element("i", {{"class", "build"}}),
                "another build"});
  // Scalars and distributions together, by key; a key may be both.
  std::vector<std::string_view> keys;
  std::vector<bool> areDistributions;
  auto scalar = data.scalars.begin();
  auto distribution = data.distributions.begin();
  while (scalar != data.scalars.end() || distribution != data.distributions.end()) {
    const bool isDistribution =
        scalar == data.scalars.end() ||
        (distribution != data.distributions.end() && distribution->first < scalar->first);
    keys.push_back(isDistribution ? (distribution++)->first : (scalar++)->first);
    areDistributions.push_back(isDistribution);
  }
  table.add(document, keys, [&](std::size_t place) {
    const std::string_view key = keys[place];
    KeyCourse course =
        areDistributions[place]
            ? distributionCourse(key, data.distributions.at(key), days, table.isDetailed())
            : scalarCourse(key, data.scalars.at(key), days, table.isDetailed());
    course.isUnusual = changes.isUnusual(key);
    return course;
  });
  document.endSection();
}

}  // namespace vesprun
