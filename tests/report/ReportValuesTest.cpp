#include <algorithm>
#include <cmath>
#include <limits>
#include <random>
#include <sstream>

#include "common/TextForm.h"
#include "platform/host/documents/JsonForm.h"
#include "report/DistributionBatch.h"
#include "report/Histogram.h"
#include "report/RoundScalar.h"
#include "report/TBReport.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

struct ListedValues final : TBHistoryDistributionEnumerator {
  explicit ListedValues(std::vector<double> listed) : values(listed.rbegin(), listed.rend()) {}
  bool getNextValueSecondsInDayOffset(double& value, std::int32_t* /*secondsInDay*/) override {
    if (values.empty()) {
      return false;
    }
    value = values.back();
    values.pop_back();
    return true;
  }
  std::vector<double> values;
};

TEST(Distributions, AreSummarizedAndCounted) {
  TestDevice device;
  const struct {
    std::vector<double> values;
    std::optional<PropertyArray> intervals;
    std::string expected;
  } kCases[] = {
      {{1, 2, 3, 4}, std::nullopt, "(1, 4, 2.5, 5, 4)"},
      {{5, 10, 50, 500},
       PropertyArray{10, 100},
       "(5, 500, 141.25, 172818.74999999997, 4) {(-inf, 10] = 2; (10, 100] = 1; (100, inf) = 1}"},
      {{}, PropertyArray{10, 100}, "(0, 0, 0, 0, 0)"},
      {{-2.5}, std::nullopt, "(-2.5, -2.5, -2.5, 0, 1)"},
      {{-kInfinity, 3, kNaN},
       PropertyArray{3},
       "(-inf, 3, nan, nan, 3) {(-inf, 3] = 2; (3, inf) = 1}"},
      {{1, 2}, PropertyArray{}, "(1, 2, 1.5, 0.5, 2) {(-inf, inf) = 2}"},
      {{4, 6, 9, 12},
       PropertyArray{5.0, 2.5, 10, 11, kInfinity},
       "(4, 12, 7.75, 36.75, 4) {(-inf, 5] = 1; (2.5, 10] = 2; (11, inf] = 1}"},
  };
  TBReport report;
  for (const auto& [values, intervals, expected] : kCases) {
    // Each case replaces the one before it; an empty histogram removes it.
    ListedValues listed(values);
    report.computeAndAddDistributionForKeyWithOptions(listed, "key",
                                                      {intervals ? &*intervals : nullptr});
    const PropertyValue* histogram = report.histogramsOutput().find("key");
    EXPECT_EQ(textForm(*report.distributionsOutput().find("key")) +
                  (histogram != nullptr ? ' ' + textForm(*histogram) : ""),
              expected);
  }
  const PropertyArray& last = *report.distributionsOutput().find("key")->array();
  EXPECT_EQ(last[3].number()->kind(), NumberKind::Double);
  EXPECT_EQ(last[4].number()->kind(), NumberKind::Int32);
  const PropertyDict& histogram = *report.histogramsOutput().find("key")->dict();
  EXPECT_EQ(histogram.begin()->second.number()->kind(), NumberKind::UInt64);
  EXPECT_EQ(device.log().back(), "debug: Treating key key as a histogram");
}

TEST(Distributions, AreTheSameSideBySideAsAlone) {
  TestDevice device;
  std::mt19937 random(11);
  const PropertyArray intervals{10, 1000, 100000};
  PropertyDict distributions, histograms;
  TBReport alone;
  DistributionBatch batch(distributions, histograms);
  for (int row = 0; row < 60; ++row) {
    std::vector<double> values(random() % 3 == 0 ? random() % 6000 : random() % 10);
    std::generate(values.begin(), values.end(), [&] { return std::ldexp(random(), -13); });
    const std::string key = "key" + std::to_string(random() % 20);
    const DistributionOptions options{random() % 2 == 0 ? &intervals : nullptr};
    ListedValues forBatch(values), forReport(values);
    batch.add(forBatch, key, options);
    alone.computeAndAddDistributionForKeyWithOptions(forReport, key, options);
  }
  batch.finish();
  EXPECT_EQ(jsonText(distributions), jsonText(alone.distributionsOutput()));
  EXPECT_EQ(jsonText(histograms), jsonText(alone.histogramsOutput()));
}

TEST(Histogram, TakesTheFirstBoundaryThatReachesAValue) {
  std::mt19937 random(7);
  const double kNumbers[] = {-kInfinity, -1, 0, 1, 2, 3, 4, kInfinity, kNaN};
  const auto anyNumber = [&] { return kNumbers[random() % std::size(kNumbers)]; };
  for (int i = 0; i < 5000; ++i) {
    PropertyArray intervals;
    for (std::size_t n = random() % 9; n > 0; --n) {
      intervals.emplace_back(anyNumber());
    }
    const double value = anyNumber();
    const auto first = std::find_if(intervals.begin(), intervals.end(), [&](const auto& boundary) {
      return boundary.number()->asDouble() >= value;
    });
    ASSERT_EQ(determineHistBucketForValueWithIntervals(value, HistogramBoundaries(intervals)),
              first - intervals.begin())
        << value << " in " << textForm(intervals);
  }
}

// Value, bucket interval, significant digits, what is stored.
constexpr const char* kCases = R"(
    7 5 - 5            8 5 - 10            5 10 - 10           2 3 - 3            42 - - 42
    -7 10 - -6         -5 10 - 0           -1 2 - 0            123 0 - 0          4 10 1 0
    12345 - 2 12000    -12345 - 2 -12000   12500 - 2 13000     -12500 - 2 -13000  987654 - 3 988000
    1000 - 2 1000      99 - 2 99           996 - 2 1000        0 - 1 0            5 - 0 10
    1 - 0 1            12345 - 0 0         7 - 19 7            1234 100 1 1000
    1 - 11 1           15 - 13 15          15 - 2 15           16 - 1 20          999 - 4 999
    5 18446744073709551615 - 0             12345 - 18446744073709551615 0
    -9223372036854775808 1 - -9223372036854775808
    9223372036854775807 9223372036854775808 - -9223372036854775808
    -9223372036854775808 - 1 -9223372036854775808
    -9223372036854775807 - 1 -9000000000000000000
    9223372036854775807 - 18 9223372036854775807
    999999999999999999 - 17 1000000000000000000)";

TEST(RoundScalar, KeepsToItsRules) {
  std::istringstream cases(kCases);
  const auto option = [](const std::string& text) {
    return text == "-" ? std::nullopt : std::optional<std::uint64_t>(std::stoull(text));
  };
  int count = 0;
  std::int64_t value = 0;
  std::int64_t stored = 0;
  for (std::string interval, digits; cases >> value >> interval >> digits >> stored; ++count) {
    EXPECT_EQ(roundScalar(value, {option(interval), option(digits)}), stored)
        << value << " bucket " << interval << " digits " << digits;
  }
  EXPECT_EQ(count, 37);
}

}  // namespace
}  // namespace vesprun
