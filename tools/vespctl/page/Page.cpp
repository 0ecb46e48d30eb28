#include "page/Page.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <set>

#include "common/Calendar.h"
#include "common/TextForm.h"
#include "page/Charts.h"
#include "page/Html.h"
#include "page/KeyGroups.h"
#include "page/StorageHealth.h"

namespace vesprun {
namespace {

constexpr std::size_t kLongList = 60;  // keys from which on the groups begin folded
constexpr std::size_t kShownReports = 14;
constexpr std::size_t kMostValues = 400;  // listed for one key
constexpr std::size_t kMostGaps = 12;

std::string momentText(double day) {
  const double start = std::floor(day);
  const auto number = static_cast<std::int32_t>(std::clamp(start, -2147483648.0, 2147483647.0));
  Date date = startOfDay(number);
  if (day == start) {
    return dayText(number);
  }
  date.seconds += std::llround((day - start) * static_cast<double>(kSecondsPerDay));
  return minuteText(date);
}

std::string tag(const char* name, const std::string& content) {
  return std::string("<") + name + '>' + content + "</" + name + '>';
}

/// A part of the page that can be folded away.
std::string fold(const std::string& summary, const std::string& content, bool isOpen = false) {
  return std::string("<details") + (isOpen ? " open" : "") + "><summary>" + summary + "</summary>" +
         content + "</details>\n";
}

/// A name with what unfolds below it, and with its full text there when it is shown cut.
std::string foldedName(std::string_view name, const std::string& content) {
  const std::string full =
      isLongName(name) ? "<p class=full><bdi>" + htmlText(name) + "</bdi></p>" : "";
  return full.empty() && content.empty() ? htmlName(name) : fold(htmlName(name), full + content);
}

std::string section(const char* anchor, const std::string& title, const std::string& content) {
  return std::string("<section id=") + anchor + '>' + tag("h2", title) + '\n' + content +
         "</section>\n";
}

/// What `write` makes of each key, in groups that begin and end alike.
template <typename Write>
std::string inGroups(const std::vector<std::string_view>& keys, bool areOpen,
                     const std::string& begin, Write write, const char* end) {
  std::string html;
  for (const KeyGroup& group : groupKeys(keys)) {
    std::string title =
        group.title.empty() ? (group.isRest ? "others" : "all") : htmlName(group.title);
    title += group.isRest && !group.title.empty() ? " others" : "";
    std::string content = begin;
    for (const std::size_t place : group.keys) {
      content += write(keys[place]);
    }
    html +=
        fold(title + " <small>" + numeral(group.keys.size()) + "</small>", content + end, areOpen);
  }
  return html;
}

template <typename Map>
std::vector<std::string_view> keysOf(const Map& map) {
  std::vector<std::string_view> keys;
  keys.reserve(map.size());
  for (const auto& entry : map) {
    keys.emplace_back(entry.first);
  }
  return keys;
}

class PageWriter {
 public:
  PageWriter(const std::string& device, const Date& now, const PageData& data,
             const std::vector<KeptBack>& keptBack)
      : _device(device), _now(now), _data(data), _keptBack(keptBack), _health(storageHealth(data)) {
    if (!data.days.empty()) {
      _period = {static_cast<double>(data.days.begin()->first),
                 static_cast<double>(data.days.rbegin()->first)};
    }
  }

  std::string text() const {
    return head() + overview() + reports() + storage() + scalars() + distributions() + events() +
           others() + leftOut() + "</main>\n</html>\n";
  }

 private:
  std::string head() const {
    std::string html =
        "<!DOCTYPE html>\n<html lang=en>\n<meta charset=utf-8>\n"
        "<meta http-equiv=Content-Security-Policy content=\"default-src 'none'; style-src "
        "'unsafe-inline'; base-uri 'none'; form-action 'none'\">\n"
        "<meta name=viewport content=\"width=device-width, initial-scale=1\">\n"
        "<meta name=color-scheme content=\"light dark\">\n<title>Reports of ";
    html += htmlText(_device) + "</title>\n<style>\n";
    html += pageStyle();
    return html + "</style>\n";
  }

  std::string overview() const {
    const std::string period =
        _data.days.empty()
            ? "Nothing has been reported yet."
            : "Reports of " + momentText(_period.first) +
                  (_period.first == _period.last ? "" : " to " + momentText(_period.last)) + ".";
    std::string html = "<header><p>Device reports</p><h1>" + htmlName(_device) + "</h1><p>" +
                       period + " Page made " + minuteText(_now) + " UTC.</p></header>\n<nav>";
    const auto add = [&html](const char* anchor, const std::string& number,
                             const std::string& what) {
      html += std::string("<a href=\"#") + anchor + "\"><b>" + number + "</b> " + what + "</a>";
    };
    const auto addCount = [&add](const char* anchor, std::size_t count, const char* noun,
                                 const char* rest = "") {
      add(anchor, numeral(count), std::string(noun) + (count == 1 ? "" : "s") + rest);
    };
    std::size_t sent = 0;
    for (const auto& [name, events] : _data.events) {
      sent += events.count;
    }
    addCount("reports", _data.days.size(), "day", " reported");
    add("storage", verdictMark(), "storage");
    addCount("scalars", _data.scalars.size(), "scalar");
    addCount("distributions", _data.distributions.size(), "distribution");
    addCount("events", sent, "event");
    addCount("left-out", _keptBack.size(), "key", " kept back");
    return html + "</nav>\n<main>\n";
  }

  std::string reports() const {
    std::string html = unreadableFiles();
    if (_data.days.empty()) {
      return section("reports", "Reports", html + "<p>There is no daily log in the outbox.</p>");
    }
    std::vector<double> days;
    for (const auto& [day, log] : _data.days) {
      days.push_back(day);
    }
    const std::string first = momentText(_period.first);
    const std::string last = momentText(_period.last);
    html += dayStrip(days, "days with a report from " + first + " to " + last) +
            "<p class=ends><span>" + first + "</span><span>" + last + "</span></p>" + missingDays();
    std::string newest;
    std::string older;
    std::map<std::string, std::size_t> digests;
    std::size_t count = 0;
    for (auto log = _data.submitted.rbegin(); log != _data.submitted.rend(); ++log) {
      (count++ < kShownReports ? newest : older) += reportRow(*log);
      ++digests[*log->document.findString("TBWhitelistDigest")];
    }
    const std::string tableHead =
        "<table class=reports><thead><tr><th>Day<th>Rev.<th>Submitted, "
        "UTC<th>Scalars<th>Distributions<th>Whitelist<th>Log</thead>";
    html += tableHead + newest + "</table>\n";
    if (!older.empty()) {
      html += fold(countedNoun(count - kShownReports, "earlier report"),
                   tableHead + older + "</table>");
    }
    html += "<p>Digests of the whitelist:</p><ul>";
    for (const auto& [digest, times] : digests) {
      html +=
          "<li>" + foldedName(digest, "") + " <small>" + countedNoun(times, "report") + "</small>";
    }
    return section("reports", "Reports", html + "</ul>");
  }

  static std::string reportRow(const SubmittedLog& log) {
    constexpr std::size_t kShownDigest = 8;
    const PropertyDict& document = log.document;
    const std::string& digest = *document.findString("TBWhitelistDigest");
    return "<tr><td>" + dayText(log.day) + "<td>" + std::to_string(log.revision) + "<td>" +
           minuteText(*document.findDate("TBLogCreationDate")) + "<td>" +
           numeral(document.findDict("TBScalars")->size()) + "<td>" +
           numeral(document.findDict("TBDistributions")->size()) + "<td>" +
           htmlName(digest.substr(0, kShownDigest)) + "<td>" +
           htmlText(log.name.substr(0, log.name.find('-'))) + '\n';
  }

  std::string missingDays() const {
    std::string gaps;
    std::size_t count = 0;
    std::int64_t before = _data.days.begin()->first;
    for (const auto& [day, log] : _data.days) {
      if (day - before > 1 && ++count <= kMostGaps) {
        const std::string from = dayText(static_cast<std::int32_t>(before + 1));
        const std::string to = dayText(day - 1);
        gaps += (gaps.empty() ? "" : ", ") + from + (from == to ? "" : " to " + to);
      }
      before = day;
    }
    return count == 0
               ? ""
               : "<p>No report of " + gaps +
                     (count > kMostGaps ? " and " + countedNoun(count - kMostGaps, "later gap")
                                        : "") +
                     ".</p>";
  }

  std::string unreadableFiles() const {
    std::string html;
    for (const UnreadableLog& file : _data.unreadable) {
      html += "<li>" + htmlName(file.name) + ": " + htmlText(file.why);
    }
    return html.empty() ? "" : "<p class=act>Not on this page:</p><ul>" + html + "</ul>";
  }

  HealthStatement::Level worst() const {
    auto level = HealthStatement::Level::Plain;
    for (const HealthStatement& statement : _health) {
      level = std::max(level, statement.level);
    }
    return level;
  }

  const char* verdictMark() const {
    static constexpr const char* kMarks[] = {"no verdict", "sound", "look at", "act on"};
    return kMarks[static_cast<int>(worst())];
  }

  std::string storage() const {
    static constexpr const char* kClasses[] = {"plain", "good", "look", "act"};
    static constexpr const char* kVerdicts[] = {
        "The figures allow no verdict.", "Nothing points to wear or to failing flash.",
        "Some figures deserve a look.", "The storage needs attention."};
    if (_health.empty()) {
      return section("storage", "Storage", "<p>No figure of the storage has been submitted.</p>");
    }
    const auto level = static_cast<int>(worst());
    double newest = 0;
    for (const HealthStatement& statement : _health) {
      newest = std::max(newest, std::floor(statement.day));
    }
    std::string html = std::string("<p class=\"verdict ") + kClasses[level] + "\">" +
                       kVerdicts[level] + " <small>Figures of " + momentText(newest) +
                       "</small></p>\n<ul class=health>\n";
    for (const HealthStatement& statement : _health) {
      const double day = std::floor(statement.day);
      html += std::string("<li class=") + kClasses[static_cast<int>(statement.level)] + '>' +
              statement.text + (day < newest ? " <small>" + momentText(day) + "</small>" : "") +
              '\n';
    }
    return section("storage", "Storage", html + "</ul>\n");
  }

  /// Each value of a key, one a line.
  static std::string valueList(const PageData::Series& series) {
    std::string html = "<p class=values>";
    const std::size_t count = series.size();
    for (std::size_t i = count > kMostValues ? count - kMostValues : 0; i < count; ++i) {
      html += momentText(series[i].day) + ' ' + textForm(series[i].value) + '\n';
    }
    return html + "</p>";
  }

  /// A row with the line of a number over the days. One that ended early says when.
  static std::string seriesRow(std::string_view key, const PageData::Series& series, Period period,
                               double longestStep) {
    std::vector<Point> points;
    points.reserve(series.size());
    const Number* low = &series.front().value;
    const Number* high = low;
    for (const auto& [day, value] : series) {
      points.push_back({day, value.asDouble()});
      low = value.asDouble() < low->asDouble() ? &value : low;
      high = value.asDouble() > high->asDouble() ? &value : high;
    }
    const std::string lowest = numeral(*low);
    const std::string highest = numeral(*high);
    const std::string newest = numeral(series.back().value);
    const std::string ended = series.back().day < period.last
                                  ? " <small>" + momentText(series.back().day) + "</small>"
                                  : "";
    return "<tr><td>" + foldedName(key, valueList(series)) + "<td>" +
           sparkline(points, period, longestStep,
                     countedNoun(series.size(), "value") + " from " + lowest + " to " + highest +
                         ", the newest " + newest) +
           "<td>" + newest + ended + "<td>" + lowest + "<td>" + highest + "<td>" +
           numeral(series.size()) + '\n';
  }

  static std::string seriesHead(const char* count) {
    return std::string(
               "<table class=series><thead><tr><th>Key<th>Over the days<th>Newest<th>Lowest<th>"
               "Highest<th>") +
           count + "</thead>";
  }

  std::string scalars() const {
    const auto keys = keysOf(_data.scalars);
    const auto row = [this](std::string_view key) {
      return seriesRow(key, _data.scalars.at(key), _period, 1);
    };
    return section("scalars", "Scalars",
                   keys.empty() ? "<p>No scalar has been reported.</p>"
                                : inGroups(keys, keys.size() <= kLongList, seriesHead("Days"), row,
                                           "</table>"));
  }

  std::string distributions() const {
    const auto keys = keysOf(_data.distributions);
    const auto article = [this](std::string_view key) {
      return distribution(key, _data.distributions.at(key));
    };
    return section("distributions", "Distributions",
                   keys.empty() ? "<p>No distribution has been reported.</p>"
                                : inGroups(keys, keys.size() <= kLongList, "", article, ""));
  }

  static double deviation(const PageData::DistributionDay& day) {
    const double count = day.count.asDouble();
    return count > 0 ? std::sqrt(day.squaredDeviations / count) : 0;
  }

  std::string distribution(std::string_view key,
                           const std::vector<PageData::DistributionDay>& days) const {
    const PageData::DistributionDay& newest = days.back();
    std::string rows;
    std::vector<BandPoint> points;
    for (const PageData::DistributionDay& day : days) {
      rows += "<tr><td>" + dayText(day.day) + "<td>" + numeral(day.count) + "<td>" +
              numeral(day.minimum) + "<td>" + numeral(day.mean) + "<td>" + numeral(day.maximum) +
              "<td>" + numeral(deviation(day)) + '\n';
      const bool isDrawn = day.count.asInt64() > 0 && std::isfinite(day.minimum) &&
                           std::isfinite(day.mean) && std::isfinite(day.maximum);
      if (isDrawn) {
        points.push_back({static_cast<double>(day.day), day.minimum, day.mean, day.maximum});
      }
    }
    return "<article><h3>" + foldedName(key, "") + "</h3><p class=newest>" + dayText(newest.day) +
           ": <b>" + numeral(newest.count) + "</b> values from <b>" + numeral(newest.minimum) +
           "</b> to <b>" + numeral(newest.maximum) + "</b>, mean <b>" + numeral(newest.mean) +
           "</b>, standard deviation <b>" + numeral(deviation(newest)) +
           "</b></p><div class=pair>" + histogram(days) + course(points) + "</div>" +
           fold("Day by day",
                "<table class=days><thead><tr><th>Day<th>Values<th>Lowest<th>Mean<th>Highest"
                "<th>Deviation</thead>" +
                    rows + "</table>") +
           "</article>\n";
  }

  /// Lowest, mean and highest value of each day.
  std::string course(const std::vector<BandPoint>& points) const {
    if (points.empty()) {
      return "";
    }
    const auto [low, high] = rangeOf(points);
    const std::string ends = numeral(low) + " to " + numeral(high);
    return "<figure><figcaption>Lowest, mean and highest of each day" +
           std::string(isLogarithmic(low, high) ? ", logarithmic" : "") +
           "</figcaption><p class=ends>" + numeral(high) + "</p>" +
           bandChart(points, _period,
                     countedNoun(points.size(), "day") + " with values from " + ends) +
           "<p class=ends>" + numeral(low) + "</p><p class=\"ends dates\"><span>" +
           momentText(_period.first) + "</span><span>" + momentText(_period.last) +
           "</span></p></figure>";
  }

  struct Bucket {
    std::string_view label;
    double newest = 0;  ///< count on the newest day with a histogram
    double all = 0;     ///< on all days together
  };

  /// The lower boundary in a label "(1, 10]", by which buckets are ordered.
  static double lowerBoundary(std::string_view label) {
    double boundary = HUGE_VAL;
    if (label.starts_with('(')) {
      std::from_chars(label.data() + 1, label.data() + label.size(), boundary);
    }
    return std::isnan(boundary) ? HUGE_VAL : boundary;
  }

  /// The buckets of all days. An empty bucket is in no histogram, so each day may know others.
  static std::vector<Bucket> bucketsOf(const std::vector<PageData::DistributionDay>& days,
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
    std::stable_sort(buckets.begin(), buckets.end(), [](const Bucket& left, const Bucket& right) {
      return lowerBoundary(left.label) < lowerBoundary(right.label);
    });
    return buckets;
  }

  static std::string histogram(const std::vector<PageData::DistributionDay>& days) {
    std::int32_t newestDay = 0;
    const std::vector<Bucket> buckets = bucketsOf(days, newestDay);
    if (buckets.empty()) {
      return "<figure><figcaption>No histogram is reported</figcaption></figure>";
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
    std::string html = "<figure><figcaption>Histogram of " + dayText(newestDay) +
                       (days.size() > 1 ? "; <i class=mark></i> share over all days" : "") +
                       "</figcaption><table class=histogram>";
    for (const Bucket& bucket : buckets) {
      html += "<tr><th>" + foldedName(bucket.label, "") + "<td>" +
              bar(share(share(bucket.newest, newest), longest),
                  days.size() > 1 ? share(share(bucket.all, all), longest) : 0) +
              "<td>" + numeral(bucket.newest) + '\n';
    }
    return html + "</table></figure>";
  }

  std::string events() const {
    std::string html;
    for (const auto& [name, events] : _data.events) {
      const std::string title =
          htmlName(name) + " <small>" + numeral(events.count) + " sent" +
          (events.newest.back().day > 0 ? ", the last " + momentText(events.newest.back().day)
                                        : "") +
          "</small>";
      html += fold(title, (isLongName(name) ? "<p class=full>" + htmlText(name) + "</p>" : "") +
                              eventFields(events.newest));
    }
    return section("events", "Analytics events",
                   html.empty() ? "<p>No analytics event has been sent.</p>" : html);
  }

  /// The fields of the newest event, their numbers with their course over the earlier ones.
  static std::string eventFields(const std::vector<PageData::Event>& events) {
    std::string rows;
    std::string texts;
    std::string zeros;
    std::size_t zeroCount = 0;
    for (const auto& [field, value] : events.back().payload) {
      PageData::Series series;
      bool isZero = true;
      for (const PageData::Event& event : events) {
        const Number* const number = event.payload.findNumber(field);
        if (number != nullptr) {
          series.push_back({event.day, *number});
          isZero = isZero && number->asDouble() == 0;
        }
      }
      if (value.number() == nullptr) {
        texts += "<tr><th>" + foldedName(field, "") + "<td>" + foldedName(textForm(value), "");
      } else if (isZero) {
        ++zeroCount;
        zeros += (zeros.empty() ? "" : ", ") + htmlName(field);
      } else {
        rows += seriesRow(field, series, {events.front().day, events.back().day}, HUGE_VAL);
      }
    }
    return (rows.empty() ? "" : seriesHead("Events") + rows + "</table>") +
           (texts.empty() ? "" : "<table class=texts>" + texts + "</table>") +
           (zeros.empty() ? ""
                          : fold(countedNoun(zeroCount, "field") + " always 0",
                                 "<p class=names>" + zeros + "</p>"));
  }

  std::string others() const {
    if (_data.others.empty()) {
      return "";
    }
    std::string html = "<ul>";
    for (const auto& [what, count] : _data.others) {
      html += "<li>" + htmlName(what) + " <small>" + numeral(count) + "</small>";
    }
    return section("others", "Other logs and records", html + "</ul>");
  }

  std::string leftOut() const {
    std::string html;
    for (const bool isDistribution : {false, true}) {
      std::set<std::string_view> sorted;
      for (const KeptBack& row : _keptBack) {
        if (row.isDistribution == isDistribution) {
          sorted.insert(row.key);
        }
      }
      const std::vector<std::string_view> keys(sorted.begin(), sorted.end());
      const auto item = [](std::string_view key) { return "<li>" + foldedName(key, ""); };
      if (!keys.empty()) {
        html += "<h3>" + countedNoun(keys.size(), isDistribution ? "distribution" : "scalar") +
                "</h3>" +
                inGroups(keys, _keptBack.size() <= kLongList, "<ul class=keys>", item, "</ul>");
      }
    }
    const char* const explanation =
        html.empty() ? "<p>Every key of the counter database may leave the device.</p>"
                     : "<p>These keys are in the counter database and do not leave the device. "
                       "Their values are not on this page.</p>";
    return section("left-out", "Kept back", explanation + html);
  }

  const std::string& _device;
  const Date& _now;
  const PageData& _data;
  const std::vector<KeptBack>& _keptBack;
  std::vector<HealthStatement> _health;
  Period _period{0, 0};  ///< from the first to the last day with a report
};

}  // namespace

std::string pageText(const std::string& device, const Date& now, const PageData& data,
                     const std::vector<KeptBack>& keptBack) {
  return PageWriter(device, now, data, keptBack).text();
}

}  // namespace vesprun
