#include "Statistics.h"

#include <gmock/gmock.h>

#include <cmath>
#include <limits>
#include <random>

namespace vesprun {
namespace {

using ::testing::ElementsAre;

/// The statistics of values in one pass over all, as a device makes them.
Statistics inOnePass(const std::vector<double>& values) {
  Statistics all{values.front(), values.front(), 0, 0, 0};
  long double mean = 0;
  long double deviations = 0;
  for (const double value : values) {
    all.minimum = std::min(all.minimum, value);
    all.maximum = std::max(all.maximum, value);
    ++all.count;
    const long double distance = value - mean;
    mean += distance / static_cast<long double>(all.count);
    deviations += distance * (value - mean);
  }
  all.mean = static_cast<double>(mean);
  all.deviations = static_cast<double>(deviations);
  return all;
}

TEST(StatisticsTest, MergesToWhatOnePassOverAllValuesGives) {
  std::mt19937_64 random(7);
  for (const double center : {0.0, 1e9, -1e12}) {
    std::vector<double> all;
    std::vector<Statistics> parts;
    for (int device = 0; device < 40; ++device) {
      std::vector<double> values(1 + random() % 300);
      for (double& value : values) {
        value = center + std::ldexp(static_cast<double>(random() % 1000000), device % 9 - 12);
      }
      all.insert(all.end(), values.begin(), values.end());
      parts.push_back(inOnePass(values));
    }
    const Statistics expected = inOnePass(all);
    const Statistics merged = mergedStatistics(parts);
    EXPECT_EQ(merged.count, expected.count);
    EXPECT_EQ(merged.minimum, expected.minimum);
    EXPECT_EQ(merged.maximum, expected.maximum);
    EXPECT_NEAR(merged.mean, expected.mean, 1e-15 * (std::abs(center) + 1e4));
    EXPECT_NEAR(merged.deviations, expected.deviations, 1e-7 * expected.deviations);

    std::shuffle(parts.begin(), parts.end(), random);
    const Statistics shuffled = mergedStatistics(parts);
    EXPECT_EQ(shuffled.mean, merged.mean) << "the order makes no difference";
    EXPECT_EQ(shuffled.deviations, merged.deviations);
  }
}

TEST(StatisticsTest, MergesMeansFarFromZeroAndOnePartUnchanged) {
  // The deviations of the means, 2 · 0.5², would vanish in the squares of the means.
  const Statistics merged = mergedStatistics({{0, 1, 1e15, 2, 2}, {0, 1, 1e15 + 1, 3, 2}});
  EXPECT_EQ(merged.mean, 1e15 + 0.5);
  EXPECT_EQ(merged.deviations, 2 + 3 + 1.0);
  EXPECT_EQ(mergedStatistics({{1, 2, 0.1, 5, 2147483647}}).mean, 0.1);
  EXPECT_EQ(mergedStatistics({{0, 0, 0, 0, 2147483647}, {0, 0, 0, 0, 2147483647}}).count,
            4294967294);
}

TEST(StatisticsTest, SummarizesIntegersWithoutOverflow) {
  constexpr auto kLeast = std::numeric_limits<std::int64_t>::min();
  constexpr auto kGreatest = std::numeric_limits<std::int64_t>::max();
  EXPECT_EQ(summaryOf({kGreatest, kGreatest, kGreatest}).mean, 9223372036854775807.0);
  EXPECT_EQ(summaryOf({kLeast, kLeast, kGreatest, kGreatest}).mean, -0.5);
  EXPECT_EQ(summaryOf({-1, -2, -4}).mean, -7.0 / 3);

  std::vector<std::int64_t> values;
  for (std::int64_t value = 40; value > 0; --value) {
    values.push_back(value);
  }
  const Summary summary = summaryOf(values);
  EXPECT_EQ(summary.minimum, 1);
  EXPECT_EQ(summary.maximum, 40);
  EXPECT_THAT(summary.quantiles, ElementsAre(2, 10, 20, 30, 38));
  EXPECT_THAT(summaryOf({7}).quantiles, ElementsAre(7, 7, 7, 7, 7));
  EXPECT_THAT(summaryOf({1, 2, 3}).quantiles, ElementsAre(1, 1, 2, 3, 3));
}

TEST(StatisticsTest, OrdersLabelsByTheirBoundariesAndNoticesOverlap) {
  bool overlap = false;
  EXPECT_THAT(
      labelsInOrder({{"(100, inf)", 1}, {"(-inf, 20]", 1}, {"(20, 100]", 1}, {"x", 1}}, overlap),
      ElementsAre("(-inf, 20]", "(20, 100]", "(100, inf)", "x"));
  EXPECT_FALSE(overlap);
  EXPECT_THAT(labelsInOrder({{"(10, 30]", 1}, {"(-inf, 20]", 1}}, overlap),
              ElementsAre("(-inf, 20]", "(10, 30]"));
  EXPECT_TRUE(overlap);
}

}  // namespace
}  // namespace vesprun
