#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "page/Element.h"

namespace vesprun {

// Small pictures in SVG, without a size of their own and without text but a label.

/// The days, with fractions, at the left and the right end of a picture.
struct Period {
  double first = 0;
  double last = 0;
};

/// A value and when it was, in days.
struct Point {
  double day;
  double value;
};

/// The days that all pictures of a page have marks at.
struct MarkedDays {
  std::vector<std::int32_t> boots;
  std::vector<std::int32_t> builds;  ///< first days of another system
};

/// What all pictures of a page share, once on it: the marks.
Element sharedShapes(const MarkedDays& marked, Period period);

/// A line through points in the order of their days, with a dot at the last one. It is interrupted
/// where more than `longestStep` days lie between two. The scale begins at 0, or ends there.
/// Values that are not finite are left out.
Element sparkline(const std::vector<Point>& points, Period period, double longestStep,
                  const std::string& label, bool hasMarks = true);

/// A line within a band.
struct BandPoint {
  double day;
  double low;
  double middle;
  double high;
};

/// The lowest and the highest value of a scale: 0 belongs to it.
std::pair<double, double> scaleOf(const std::vector<BandPoint>& points);

/// Whether the ends of a band are so far apart that it is drawn over a logarithmic scale.
bool isLogarithmic(const std::vector<BandPoint>& points);

/// A band and its line over the days, interrupted where a day is missing.
Element bandChart(const std::vector<BandPoint>& points, Period period, const std::string& label);

/// A bar of a length from 0 to 1, with a mark at another length.
Element bar(double length, double mark);

/// A row of cells from the first to the last of the ascending days, with those of `days` filled.
Element dayStrip(const std::vector<double>& days, Period period, const std::string& label);

/// The course of values in letters, from 'A', the least, to 'z', and '-' for days without, one for
/// each day, or where there are more of them for each of `maxColumns` parts of the period; a number
/// repeats what stands before it. The page's script draws it.
std::string letteredCourse(const std::vector<Point>& points, Period period, std::size_t maxColumns);

}  // namespace vesprun
