#include "page/Charts.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <string_view>

namespace vesprun {
namespace {

// Coordinates are whole numbers on this grid, which keeps a page of many lines small.
constexpr double kWidth = 300;
constexpr double kHeight = 99;
constexpr double kMargin = 5;

/// Maps one range onto another; the middle when the range is a single value.
class Scale {
 public:
  Scale(double from, double to, double start, double end)
      : _from(from), _to(to), _start(start), _end(end) {}

  std::int64_t operator()(double value) const {
    // Halved, since the ends may be as far apart as two doubles can.
    const double range = _to / 2 - _from / 2;
    const double share = range > 0 ? (value / 2 - _from / 2) / range : 0.5;
    return std::llround(_start + std::clamp(share, 0.0, 1.0) * (_end - _start));
  }

 private:
  double _from, _to, _start, _end;
};

Scale acrossOf(Period period) { return {period.first, period.last, kMargin, kWidth - kMargin}; }

std::string place(std::int64_t x, std::int64_t y) {
  return std::to_string(x) + ' ' + std::to_string(y);
}

Element path(ConstantText kind, std::string steps) {
  return {"path", {{"class", kind.text()}, {"d", std::move(steps)}}};
}

Element picture(ConstantText kind, const std::string& label, std::vector<Element> content,
                const char* box = "0 0 300 99") {
  return {"svg",
          {{"class", kind.text()},
           {"viewBox", box},
           {"preserveAspectRatio", "none"},
           {"role", "img"},
           {"aria-label", label}},
          std::move(content)};
}

Element marks() { return {"use", {{"href", "#days"}}}; }

/// Steps from place to place: those after the first are relative, which is shorter.
class Steps {
 public:
  void moveTo(std::int64_t x, std::int64_t y) {
    endRun();
    _text += 'M' + place(x, y);
    _x = x;
    _y = y;
    _isDot = true;
  }
  void lineTo(std::int64_t x, std::int64_t y) {
    if (x == _x && y == _y) {
      return;
    }
    if (y == _y) {
      _text += 'h' + std::to_string(x - _x);
    } else {
      const std::int64_t down = y - _y;
      _text += 'l' + std::to_string(x - _x) + (down < 0 ? "" : " ") + std::to_string(down);
    }
    _x = x;
    _y = y;
    _isDot = false;
  }
  std::string text() {
    endRun();
    return std::move(_text);
  }

 private:
  void endRun() {
    _text += _isDot ? "h0" : "";  // a single day is seen, too
    _isDot = false;
  }

  std::string _text;
  std::int64_t _x = 0;
  std::int64_t _y = 0;
  bool _isDot = false;
};

/// Many points of one column of the grid make a line up and down in it: a path is at most as long
/// as the picture is wide.
std::string lineThrough(const std::vector<Point>& points, double longestStep, const Scale& across,
                        const Scale& up) {
  Steps steps;
  for (std::size_t i = 0; i < points.size();) {
    const std::int64_t x = across(points[i].day);
    const std::int64_t first = up(points[i].value);
    if (i == 0 || points[i].day - points[i - 1].day > longestStep) {
      steps.moveTo(x, first);
    } else {
      steps.lineTo(x, first);
    }
    std::int64_t low = first;
    std::int64_t high = first;
    std::int64_t last = first;
    for (const double day = points[i].day;
         i < points.size() && across(points[i].day) == x &&
         (points[i].day == day || points[i].day - points[i - 1].day <= longestStep);
         ++i) {
      last = up(points[i].value);
      low = std::min(low, last);
      high = std::max(high, last);
    }
    steps.lineTo(x, low);
    steps.lineTo(x, high);
    steps.lineTo(x, last);
  }
  return steps.text();
}

std::vector<Point> finite(const std::vector<Point>& all, Period period) {
  std::vector<Point> points;
  std::copy_if(all.begin(), all.end(), std::back_inserter(points), [period](const Point& point) {
    return std::isfinite(point.value) && point.day >= period.first && point.day <= period.last;
  });
  return points;
}

std::pair<double, double> scaleOf(const std::vector<Point>& points) {
  std::pair<double, double> scale{0, 0};
  for (const Point& point : points) {
    scale = {std::min(scale.first, point.value), std::max(scale.second, point.value)};
  }
  return scale;
}

double lowestOf(const std::vector<BandPoint>& points) {
  return std::ranges::min_element(points, {}, &BandPoint::low)->low;
}

}  // namespace

Element sharedShapes(const MarkedDays& marked, Period period) {
  const Scale across = acrossOf(period);
  const auto ticks = [&](const std::vector<std::int32_t>& days, const char* length) {
    std::string steps;
    std::int64_t before = -1;
    for (const double day : days) {
      if (day >= period.first && day <= period.last && across(day) != before) {
        before = across(day);
        steps += 'M' + place(before, 99) + length;
      }
    }
    return steps;
  };
  Element group("g", {{"id", "days"}});
  group.add(path("o", ticks(marked.boots, "v-12")));
  group.add(path("v", ticks(marked.builds, "v-99")));
  return {
      "svg", {{"class", "none"}, {"aria-hidden", "true"}}, Element("defs", {}, std::move(group))};
}

Element sparkline(const std::vector<Point>& all, Period period, double longestStep,
                  const std::string& label, bool hasMarks) {
  const std::vector<Point> points = finite(all, period);
  if (points.empty()) {
    return {};
  }
  const auto [low, high] = scaleOf(points);
  const Scale across = acrossOf(period);
  const Scale up(low, high, low == high ? kHeight * 2 - 3 * kMargin : kHeight - kMargin,
                 low == high ? 0 : 3 * kMargin);
  const Point& last = points.back();
  std::vector<Element> content;
  if (hasMarks) {
    content.push_back(marks());
  }
  content.push_back(path("m", lineThrough(points, longestStep, across, up)));
  content.push_back(path("e", "M" + place(across(last.day), up(last.value)) + "h0"));
  return picture("l", label, std::move(content));
}

std::pair<double, double> scaleOf(const std::vector<BandPoint>& points) {
  std::pair<double, double> range(0, 0);
  for (const BandPoint& point : points) {
    range = {std::min(range.first, point.low), std::max(range.second, point.high)};
  }
  if (isLogarithmic(points)) {
    range.first = lowestOf(points);
  }
  return range;
}

bool isLogarithmic(const std::vector<BandPoint>& points) {
  constexpr double kMinRatio = 50;
  const double low = points.empty() ? 0 : lowestOf(points);
  return low > 0 && std::ranges::max_element(points, {}, &BandPoint::high)->high / low >= kMinRatio;
}

Element bandChart(const std::vector<BandPoint>& all, Period period, const std::string& label) {
  std::vector<BandPoint> points;
  std::copy_if(all.begin(), all.end(), std::back_inserter(points),
               [period](const BandPoint& point) {
                 return point.day >= period.first && point.day <= period.last;
               });
  if (points.empty()) {
    return {};
  }
  const auto [low, high] = scaleOf(points);
  const bool isOverLogarithm = isLogarithmic(points);
  const auto shown = [=](double value) { return isOverLogarithm ? std::log10(value) : value; };
  const Scale across = acrossOf(period);
  const Scale up(shown(low), shown(high), kHeight - 1, 1);
  std::string area;
  Steps line;
  for (std::size_t i = 0; i < points.size();) {
    Steps border;
    std::vector<std::pair<std::int64_t, std::int64_t>> back;
    std::int64_t before = -1;
    const std::size_t start = i;
    for (; i < points.size() && (i == start || points[i].day - points[i - 1].day <= 1); ++i) {
      const std::int64_t x = across(points[i].day);
      if (x == before) {
        continue;  // so many days that they share a column
      }
      const std::int64_t top = up(shown(points[i].high));
      const std::int64_t middle = up(shown(points[i].middle));
      before < 0 ? border.moveTo(x, top) : border.lineTo(x, top);
      before < 0 ? line.moveTo(x, middle) : line.lineTo(x, middle);
      back.emplace_back(x, up(shown(points[i].low)));
      before = x;
    }
    std::for_each(back.rbegin(), back.rend(),
                  [&border](const auto& corner) { border.lineTo(corner.first, corner.second); });
    area += border.text() + 'z';
  }
  const BandPoint& last = points.back();
  return picture("r", label,
                 {path("a", area), marks(), path("m", line.text()),
                  path("e", "M" + place(across(last.day), up(shown(last.middle))) + "h0")});
}

Element bar(double length, double mark) {
  const Scale across(0, 1, 0, kWidth);
  Element picture("svg",
                  {{"class", "b"},
                   {"viewBox", "0 0 300 9"},
                   {"preserveAspectRatio", "none"},
                   {"aria-hidden", "true"}},
                  Element("path", {{"d", "M0 0h" + std::to_string(across(length)) + "v9H0"}}));
  if (mark > 0) {
    picture.add(path("t", "M" + place(across(mark), 0) + "v9"));
  }
  return picture;
}

Element dayStrip(const std::vector<double>& days, Period period, const std::string& label) {
  constexpr double kMaxCells = 100;
  const double cell = period.last - period.first < kMaxCells ? 0.88 : 1.0;
  const Scale across(period.first, period.last + cell, 0, kWidth * 10);
  std::string steps;
  std::int64_t end = -1;
  for (const double day : days) {
    if (day < period.first || day > period.last) {
      continue;
    }
    const std::int64_t start = across(day);
    if (start > end) {
      end = std::max(start + 1, across(day + cell));
      steps += "M" + place(start, 0) + 'H' + std::to_string(end) + "V99H" + std::to_string(start);
    }
  }
  return picture("s", label, {Element("path", {{"d", steps}})}, "0 0 3000 99");
}

std::string letteredCourse(const std::vector<Point>& all, Period period, std::size_t maxColumns) {
  static constexpr std::string_view kLetters =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz";
  const std::vector<Point> points = finite(all, period);
  const auto [low, high] = scaleOf(points);
  // A column between two days would look like a day without a value.
  const std::size_t columns =
      std::min(maxColumns, static_cast<std::size_t>(period.last - period.first) + 1);
  const Scale across(period.first, period.last, 0, static_cast<double>(columns - 1));
  const Scale up(low, high, 0, static_cast<double>(kLetters.size() - 1));
  std::string course(columns, '-');
  for (const Point& point : points) {
    course[static_cast<std::size_t>(across(point.day))] =
        kLetters[static_cast<std::size_t>(low == high ? 0 : up(point.value))];
  }
  std::string text;
  for (std::size_t from = 0; from < course.size();) {
    const std::size_t to = std::min(course.find_first_not_of(course[from], from), course.size());
    text += course[from] + (to - from > 1 ? std::to_string(to - from) : std::string());
    from = to;
  }
  return text;
}

}  // namespace vesprun
