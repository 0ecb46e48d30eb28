#include "page/FleetPage.h"

#include <algorithm>
#include <cmath>
#include <ctime>
#include <map>
#include <set>

#include "commandline/Progress.h"
#include "common/Calendar.h"
#include "page/ChangeList.h"
#include "page/Changes.h"
#include "page/KeyTable.h"
#include "page/KeyWords.h"
#include "store/Comparison.h"

namespace vesprun {
namespace {

constexpr std::int32_t kMaxDays = 400;
constexpr std::int32_t kWeek = 7;
constexpr std::size_t kMedian = 2;  // among the percents of a summary

const char* const kNoText = "none";

struct DevicesOfDay {
  std::int32_t day;
  std::string build;
  std::uint64_t devices;
};

/// A key on one day: what most devices had.
struct FleetDay {
  std::int32_t day;
  double middle;              ///< the median, else the mean
  std::optional<double> low;  ///< of a band
  std::optional<double> high;
};

struct FleetKey {
  ReportedKey reported;
  std::vector<FleetDay> days;
  bool areMedians = true;
};

class FleetPage {
 public:
  FleetPage(FleetStore& store, const std::string& title) : _store(store), _title(title) {
    store.visitLastDays(Member::Build,
                        [this](std::int32_t day, const MemberText& build, std::uint64_t devices) {
                          _last.push_back({day, build.value_or(kNoText), devices});
                          _devices += devices;
                        });
    _newest = newestDay();
    store.visitKeys([this](const ReportedKey& key) {
      if (key.devices >= _store.least()) {
        _keys.push_back({key, {}, true});
      }
    });
    takeDays();
    takeBuilds();
  }

  std::string text() {
    const std::string title =
        _title.empty() ? "Fleet of " + countedNoun(_devices, "device") : _title;
    Document document("Fleet: " + title);
    MarkedDays marked;
    for (const auto& [build, day] : _buildsBegin) {
      if (day > _period.first) {
        marked.builds.push_back(day);
      }
    }
    std::ranges::sort(marked.builds);
    document.add(sharedShapes(marked, _period));
    document.add(pageHeader(title, {headerText()}));
    document.add(Element::constant("\n<main>"));
    addChanges(document);
    document.add({"div", {{"id", "tools"}}});
    addBuilds(document);
    addKeys(document);
    addDevices(document);
    return document.finished();
  }

 private:
  std::string headerText() const {
    std::string text = countedNoun(_devices, "device") + ", answers are over at least " +
                       numeral(static_cast<std::size_t>(_store.least())) + " of them.";
    return _keys.empty() || _first > _newest ? text : daysText(_first, _newest) + " · " + text;
  }

  Question questionOf(const ReportedKey& key) const {
    Question question;
    question.key = key.key;
    question.days = {_newest - kMaxDays + 1, _newest};
    question.least = _store.least();
    return question;
  }

  /// The newest day that enough devices have reached: one whose clock is ahead makes no day.
  std::int32_t newestDay() const {
    const auto tomorrow = static_cast<std::int32_t>(std::time(nullptr) / kSecondsPerDay) + 1;
    std::uint64_t devices = 0;
    for (auto last = _last.rbegin(); last != _last.rend(); ++last) {
      devices += last->devices;
      if (last->day <= tomorrow && devices >= _store.least()) {
        return last->day;
      }
    }
    return _last.empty() ? 0 : std::min(_last.back().day, tomorrow);
  }

  void takeDays() {
    _first = _newest;
    Progress progress("Asking", "keys", _keys.size());
    for (FleetKey& key : _keys) {
      progress.advance();
      if (key.reported.kind == KeyKind::Scalar) {
        takeScalar(key);
      } else {
        _store.answerDistribution(questionOf(key.reported), [&key](const auto& answer) {
          if (answer.statistics) {
            const double mean = answer.statistics->mean;
            const double deviation = std::sqrt(answer.statistics->deviations /
                                               static_cast<double>(answer.statistics->count));
            key.days.push_back({answer.group.from, mean, mean - deviation, mean + deviation});
          }
        });
        key.areMedians = false;
      }
      if (!key.days.empty()) {
        _first = std::min(_first, key.days.front().day);
      }
    }
    _period = {static_cast<double>(_first), static_cast<double>(_newest)};
  }

  void takeScalar(FleetKey& key) {
    std::vector<std::pair<std::int32_t, Summary>> days;
    _store.answerScalar(questionOf(key.reported), [&days](const ScalarAnswer& answer) {
      if (answer.summary) {
        days.emplace_back(answer.group.from, *answer.summary);
      }
    });
    // The widest quantiles that every day has.
    std::size_t low = 0;
    for (const auto& [day, summary] : days) {
      while (low < kMedian && !(summary.quantiles[low] && summary.quantiles[2 * kMedian - low])) {
        ++low;
      }
      key.areMedians = key.areMedians && summary.quantiles[kMedian];
    }
    for (const auto& [day, summary] : days) {
      const auto quantile = [&quantiles =
                                 summary.quantiles](std::size_t place) -> std::optional<double> {
        return place == kMedian ? std::nullopt
                                : std::optional(static_cast<double>(*quantiles[place]));
      };
      key.days.push_back(
          {day, key.areMedians ? static_cast<double>(*summary.quantiles[kMedian]) : summary.mean,
           quantile(low), quantile(2 * kMedian - low)});
    }
  }

  /// The first day of each build that enough devices have, by the key that most devices report.
  void takeBuilds() {
    const auto widest = std::ranges::max_element(
        _keys, {}, [](const FleetKey& key) { return key.reported.devices; });
    if (widest == _keys.end()) {
      return;
    }
    Question question = questionOf(widest->reported);
    question.by = Member::Build;
    const auto take = [this](const auto& answer) {
      if (answer.group.member && answer.group.devices >= _store.least()) {
        _buildsBegin.try_emplace(*answer.group.member, answer.group.from);
      }
    };
    if (widest->reported.kind == KeyKind::Scalar) {
      _store.answerScalar(question, take);
    } else {
      _store.answerDistribution(question, take);
    }
    for (const auto& [build, day] : _buildsBegin) {
      _newestBuilds.push_back(build);
    }
    std::ranges::stable_sort(_newestBuilds, {},
                             [this](const std::string& build) { return _buildsBegin.at(build); });
    constexpr std::size_t kBeside = 4;
    _newestBuilds.erase(
        _newestBuilds.begin(),
        _newestBuilds.end() - static_cast<std::ptrdiff_t>(std::min(kBeside, _newestBuilds.size())));
  }

  static std::vector<DayValue> middles(const FleetKey& key) {
    std::vector<DayValue> values;
    for (const FleetDay& day : key.days) {
      values.push_back({day.day, day.middle});
    }
    return values;
  }

  static std::vector<Point> points(const FleetKey& key) {
    std::vector<Point> line;
    for (const FleetDay& day : key.days) {
      line.push_back({static_cast<double>(day.day), day.middle});
    }
    return line;
  }

  void addChanges(Document& document) {
    document.beginSection("changed", "What changed");
    std::vector<ChangeItem> items;
    std::uint64_t stopped = 0;
    for (const DevicesOfDay& last : _last) {
      stopped += last.day > _newest - 2 * kWeek && last.day <= _newest - kWeek ? last.devices : 0;
    }
    if (stopped > 0) {
      items.push_back(
          {1e9, ChangeItem::Level::Look,
           countedNoun(stopped, "device") + " stopped reporting one to two weeks ago", "", "",
           "of " + numeral(static_cast<std::size_t>(_devices)) + " that ever reported"});
    }
    std::size_t judged = 0;
    for (const FleetKey& key : _keys) {
      const std::vector<DayValue> values = middles(key);
      const KeyWords words = wordsOf(key.reported.key);
      const auto unusual = unusualLast(words.isRunningTotal ? growthOf(values) : values);
      judged += unusual ? 1U : 0U;
      if (!unusual || unusual->day != _newest || unusual->score < kMinUnusualScore) {
        continue;
      }
      _unusual.insert(key.reported.key);
      ChangeItem item{unusual->score,
                      ChangeItem::Level::Look,
                      (words.words.empty() ? std::string() : words.words + ", ") +
                          (key.areMedians ? "median of the devices" : "mean of the devices"),
                      key.reported.key,
                      quantity(unusual->value, words.unit),
                      "usually " + quantity(unusual->usual, words.unit) + " (" +
                          quantity(unusual->lowest, words.unit) + " to " +
                          quantity(unusual->highest, words.unit) + ")"};
      item.line = sparkline(points(key), _period, 1, "its days");
      items.push_back(std::move(item));
    }
    if (_keys.empty()) {
      document.add(
          {"p", {{"class", "first"}}, "No key is reported by as many devices as an answer needs."});
    } else if (items.empty() && judged == 0) {
      document.add({"p",
                    {{"class", "first"}},
                    "It is too early to say what is unusual: a day is compared with at least " +
                        numeral(kMinDaysBefore) + " before it."});
    } else if (items.empty()) {
      document.add({"p",
                    {{"class", "quiet"}},
                    "A quiet day: on " + dayText(_newest) + " nothing of " +
                        countedNoun(_keys.size(), "key") + " was unusual over the devices."});
    }
    document.add(items.empty() ? Element() : changeList(std::move(items)));
    document.endSection();
  }

  /// What differs between the two newest builds.
  void addBuilds(Document& document) {
    document.beginSection("builds", "The two newest builds");
    if (_newestBuilds.size() < 2) {
      document.add({"p", {}, "Fewer than two builds have enough devices to be compared."});
      return document.endSection();
    }
    constexpr std::size_t kMaxRows = 20;
    ComparedGroups groups;
    groups.values = {_newestBuilds[_newestBuilds.size() - 2], _newestBuilds.back()};
    groups.days = {_newest - kMaxDays + 1, _newest};
    const std::vector<ComparedKey> keys = compareKeys(_store, groups, _store.least());
    const auto sure = static_cast<std::size_t>(
        std::ranges::count_if(keys, [](const ComparedKey& key) { return key.q <= 0.05; }));
    document.add({"p",
                  {},
                  nameElement(groups.values[0]),
                  " and ",
                  nameElement(groups.values[1]),
                  ": " + countedNoun(keys.size(), "key") + " compared, of which " + numeral(sure) +
                      " differ by more than chance (q at most 0.05)."});
    Element table("table", {{"class", "compared"}},
                  headRow({"Key", "Before", "Now", "Difference", "q"}));
    for (std::size_t i = 0; i < std::min(keys.size(), kMaxRows); ++i) {
      const ComparedKey& key = keys[i];
      const Unit unit = wordsOf(key.key).unit;
      const double difference = key.meanB - key.meanA;
      const std::string change =
          key.meanA != 0
              ? quantity(std::round(1000 * difference / std::abs(key.meanA)) / 10, Unit::Percent)
              : quantity(difference, unit);
      table.add({"tr",
                 {},
                 rowHead(foldedName(key.key)),
                 cell(quantity(key.meanA, unit)),
                 cell(quantity(key.meanB, unit)),
                 cell((difference > 0 ? "+" : "") + change),
                 cell(quantity(key.q, Unit::None))});
    }
    document.add({"div", {{"class", "scroll"}}, std::move(table)});
    document.endSection();
  }

  /// The builds beside each other, over the days of each.
  Element besideEachOther(const FleetKey& key, Unit unit) {
    Question question = questionOf(key.reported);
    question.by = Member::Build;
    question.total = true;
    Element table("table", {{"class", "beside"}}, headRow({"Build", "Devices", "Middle"}));
    const auto add = [&](const AnsweredGroup& group, std::optional<double> middle) {
      const std::string build = group.member.value_or(kNoText);
      if (group.devices >= _store.least() &&
          std::ranges::find(_newestBuilds, build) != _newestBuilds.end()) {
        table.add({"tr",
                   {},
                   rowHead(nameElement(build)),
                   cell(numeral(static_cast<std::size_t>(group.devices))),
                   cell(middle ? quantity(*middle, unit) : "too few devices")});
      }
    };
    if (key.reported.kind == KeyKind::Scalar) {
      _store.answerScalar(question, [&](const ScalarAnswer& answer) {
        std::optional<double> middle;
        if (answer.summary) {
          const auto& median = answer.summary->quantiles[kMedian];
          middle = median ? static_cast<double>(*median) : answer.summary->mean;
        }
        add(answer.group, middle);
      });
    } else {
      _store.answerDistribution(question, [&](const DistributionAnswer& answer) {
        add(answer.group,
            answer.statistics ? std::optional(answer.statistics->mean) : std::nullopt);
      });
    }
    return table;
  }

  KeyCourse courseOf(const FleetKey& key, bool isDetailed) {
    const KeyWords words = wordsOf(key.reported.key);
    KeyCourse course{key.reported.key, words.words};
    course.isUnusual = _unusual.contains(key.reported.key);
    if (key.days.empty()) {
      course.newest = "too few devices";
      return course;
    }
    course.line = points(key);
    course.newest = quantity(key.days.back().middle, words.unit);
    course.ended = key.days.back().day < _newest ? dayText(key.days.back().day) : "";
    std::vector<double> values;
    std::vector<BandPoint> band;
    for (const FleetDay& day : key.days) {
      values.push_back(day.middle);
      band.push_back({static_cast<double>(day.day), day.low.value_or(day.middle), day.middle,
                      day.high.value_or(day.middle)});
    }
    course.usual = isDetailed ? quantity(medianOf(values), words.unit) : "";
    course.lowest = quantity(*std::ranges::min_element(values), words.unit);
    course.highest = quantity(*std::ranges::max_element(values), words.unit);
    if (isDetailed) {
      const auto [low, high] = scaleOf(band);
      const std::string ends = quantity(low, words.unit) + " to " + quantity(high, words.unit);
      course.details = std::vector<Element>{
          Element("div", {{"class", "pair"}},
                  Element("figure", {},
                          Element("figcaption", {},
                                  key.reported.kind == KeyKind::Distribution
                                      ? "Mean and standard deviation of all values, " + ends
                                      : "Quantiles of the devices, " + ends),
                          bandChart(band, _period, ends)),
                  besideEachOther(key, words.unit))};
    }
    return course;
  }

  void addKeys(Document& document) {
    document.beginSection("keys", "Keys");
    document.add({"p",
                  {{"class", "key"}},
                  "The middle of the devices on each day, all over the same days and from 0. ",
                  Element("i", {{"class", "build"}}),
                  "a build begins"});
    std::vector<std::string_view> names;
    std::size_t bytes = 0;
    for (const FleetKey& key : _keys) {
      names.emplace_back(key.reported.key);
      bytes += key.reported.key.size();
    }
    const KeyTable table(_period, _keys.size(), bytes);
    Progress progress("Writing", "keys", _keys.size());
    table.add(document, names, [&](std::size_t place) {
      progress.advance();
      return courseOf(_keys[place], table.isDetailed());
    });
    document.endSection();
  }

  void addDevices(Document& document) {
    document.beginSection("devices", "Devices by their last day");
    Element table("table", {{"class", "devices"}}, headRow({"Last day", "Build", "Devices"}));
    constexpr std::size_t kMaxRows = 60;
    std::size_t rows = 0;
    for (auto last = _last.rbegin(); last != _last.rend() && rows < kMaxRows; ++last, ++rows) {
      table.add({"tr",
                 {},
                 rowHead(dayText(last->day)),
                 Element("td", {}, nameElement(last->build)),
                 cell(numeral(static_cast<std::size_t>(last->devices)))});
    }
    document.add(table);
    document.endSection();
  }

  FleetStore& _store;
  const std::string& _title;
  std::vector<DevicesOfDay> _last;
  std::uint64_t _devices = 0;
  std::vector<FleetKey> _keys;
  std::map<std::string, std::int32_t> _buildsBegin;
  std::vector<std::string> _newestBuilds;  ///< a few, by their first days
  std::set<std::string, std::less<>> _unusual;
  std::int32_t _first = 0;
  std::int32_t _newest = 0;
  Period _period;
};

}  // namespace

std::string fleetPage(FleetStore& store, const std::string& title) {
  return FleetPage(store, title).text();
}

}  // namespace vesprun
