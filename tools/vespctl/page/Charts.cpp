#include "page/Charts.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>

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

std::string place(std::int64_t x, std::int64_t y) {
  return std::to_string(x) + ' ' + std::to_string(y);
}

std::string picture(const char* kind, const std::string& label, const std::string& content,
                    const char* width = "300") {
  std::string text = "<svg class=";
  text += kind;
  return text + " viewBox=\"0 0 " + width +
         " 99\" preserveAspectRatio=none role=img aria-label=\"" + label + "\">" + content +
         "</svg>";
}

std::string path(const char* kind, const std::string& steps) {
  return std::string("<path class=") + kind + " d=\"" + steps + "\"/>";
}

std::string dot(std::int64_t x, std::int64_t y) { return path("e", "M" + place(x, y) + "h0"); }

/// Runs of points without a step that is too long.
template <typename AnyPoint>
std::vector<std::pair<std::size_t, std::size_t>> runsOf(const std::vector<AnyPoint>& points,
                                                        double longestStep) {
  std::vector<std::pair<std::size_t, std::size_t>> runs;
  for (std::size_t i = 0; i < points.size(); ++i) {
    if (i == 0 || points[i].day - points[i - 1].day > longestStep) {
      runs.emplace_back(i, i);
    }
    runs.back().second = i + 1;
  }
  return runs;
}

/// Steps through the points of one column of the grid after the other: many points make a path that
/// is no longer than the picture is wide.
std::string lineThrough(const std::vector<Point>& points, std::size_t from, std::size_t to,
                        const Scale& across, const Scale& up) {
  std::string steps;
  for (std::size_t i = from; i < to;) {
    const std::int64_t x = across(points[i].day);
    const std::int64_t first = up(points[i].value);
    std::int64_t low = first;
    std::int64_t high = first;
    std::int64_t last = first;
    for (; i < to && across(points[i].day) == x; ++i) {
      last = up(points[i].value);
      low = std::min(low, last);
      high = std::max(high, last);
    }
    steps += (steps.empty() ? 'M' : 'L') + place(x, first);
    if (low != high) {
      steps += 'V' + std::to_string(low) + 'V' + std::to_string(high) + 'V' + std::to_string(last);
    }
  }
  return steps.find('L') == std::string::npos ? steps + "h0" : steps;  // a dot is seen, too
}

}  // namespace

std::string sparkline(const std::vector<Point>& all, Period period, double longestStep,
                      const std::string& label) {
  std::vector<Point> points;
  std::copy_if(all.begin(), all.end(), std::back_inserter(points),
               [](const Point& point) { return std::isfinite(point.value); });
  if (points.empty()) {
    return "";
  }
  const auto [low, high] = std::minmax_element(
      points.begin(), points.end(),
      [](const Point& left, const Point& right) { return left.value < right.value; });
  const Scale across(period.first, period.last, kMargin, kWidth - kMargin);
  const Scale up(low->value, high->value, kHeight - 3 * kMargin, 3 * kMargin);
  std::string steps;
  for (const auto& [from, to] : runsOf(points, longestStep)) {
    steps += lineThrough(points, from, to, across, up);
  }
  const Point& last = points.back();
  return picture("l", label, path("m", steps) + dot(across(last.day), up(last.value)));
}

std::pair<double, double> rangeOf(const std::vector<BandPoint>& points) {
  std::pair range(HUGE_VAL, -HUGE_VAL);
  for (const BandPoint& point : points) {
    range = {std::min(range.first, point.low), std::max(range.second, point.high)};
  }
  return range;
}

bool isLogarithmic(double low, double high) {
  constexpr double kLeastRatio = 50;
  return low > 0 && high / low >= kLeastRatio;
}

std::string bandChart(const std::vector<BandPoint>& points, Period period,
                      const std::string& label) {
  if (points.empty()) {
    return "";
  }
  const auto [low, high] = rangeOf(points);
  const bool isOverLogarithm = isLogarithmic(low, high);
  const auto shown = [=](double value) { return isOverLogarithm ? std::log10(value) : value; };
  const Scale across(period.first, period.last, kMargin, kWidth - kMargin);
  const Scale up(shown(low), shown(high), kHeight - 1, 1);
  std::string area;
  std::string line;
  for (const auto& [from, to] : runsOf(points, 1)) {
    std::string there;
    std::string back;
    std::string through;
    std::int64_t before = -1;
    for (std::size_t i = from; i < to; ++i) {
      const std::int64_t x = across(points[i].day);
      if (x == before) {
        continue;  // so many days that they share a column
      }
      before = x;
      const char step = there.empty() ? 'M' : 'L';
      there += step + place(x, up(shown(points[i].high)));
      through += step + place(x, up(shown(points[i].middle)));
      back = 'L' + place(x, up(shown(points[i].low))) + back;
    }
    area += there + back + 'z';
    line += through + (through.find('L') == std::string::npos ? "h0" : "");
  }
  const BandPoint& last = points.back();
  return picture("r", label,
                 path("a", area) + path("m", line) + dot(across(last.day), up(shown(last.middle))));
}

std::string bar(double length, double mark) {
  const Scale across(0, 1, 0, kWidth);
  return "<svg class=b viewBox=\"0 0 300 99\" preserveAspectRatio=none aria-hidden=true><rect "
         "width=\"" +
         std::to_string(across(length)) + "\" height=\"99\"/>" +
         (mark > 0 ? path("t", "M" + place(across(mark), 0) + "v99") : "") + "</svg>";
}

std::string dayStrip(const std::vector<double>& days, const std::string& label) {
  if (days.empty()) {
    return "";
  }
  constexpr double kMostCells = 100;
  const double cell = days.back() - days.front() < kMostCells ? 0.88 : 1.0;
  const Scale across(days.front(), days.back() + cell, 0, kWidth * 10);
  std::string steps;
  std::int64_t end = -1;
  for (const double day : days) {
    const std::int64_t start = across(day);
    if (start > end) {
      end = std::max(start + 1, across(day + cell));
      steps += "M" + place(start, 0) + 'H' + std::to_string(end) + "V99H" + std::to_string(start);
    }
  }
  return picture("s", label, "<path d=\"" + steps + "\"/>", "3000");
}

}  // namespace vesprun
