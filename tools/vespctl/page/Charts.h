#pragma once

#include <string>
#include <utility>
#include <vector>

namespace vesprun {

// Small pictures in SVG, without a size of their own and without text but a label.

/// The days, with fractions, at the left and the right end of a picture.
struct Period {
  double first;
  double last;
};

/// A value and when it was, in days.
struct Point {
  double day;
  double value;
};

/// A line through points in the order of their days, with a dot at the last one. It is interrupted
/// where more than `longestStep` days lie between two. Values that are not finite are left out.
std::string sparkline(const std::vector<Point>& points, Period period, double longestStep,
                      const std::string& label);

/// A line within a band.
struct BandPoint {
  double day;
  double low;
  double middle;
  double high;
};

/// The lowest and the highest value.
std::pair<double, double> rangeOf(const std::vector<BandPoint>& points);

/// Whether the ends of a band are so far apart that it is drawn over a logarithmic scale.
bool isLogarithmic(double low, double high);

/// A band and its line over the days, interrupted where a day is missing.
std::string bandChart(const std::vector<BandPoint>& points, Period period,
                      const std::string& label);

/// A bar of a length from 0 to 1, with a mark at another length.
std::string bar(double length, double mark);

/// A row of cells from the first to the last of the ascending days, with those of `days` filled.
std::string dayStrip(const std::vector<double>& days, const std::string& label);

}  // namespace vesprun
