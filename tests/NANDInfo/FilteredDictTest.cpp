#include "NANDInfo/FilteredDict.h"

#include <gtest/gtest.h>

#include <limits>

#include "NANDInfo/SignificantDigits.h"
#include "NANDInfo/UserCapacity.h"

namespace vesprun {
namespace {

TEST(RoundSig, roundsHalfUpOnTheDigitThatIsCutOff) {
  constexpr std::uint64_t kMax = std::numeric_limits<std::uint64_t>::max();
  struct Case {
    std::uint64_t x, sig, rounded;
  };
  const Case cases[] = {
      {0, 3, 0},
      {123, 3, 123},
      {12345, 2, 12000},
      {12499, 2, 12000},
      {12500, 2, 13000},
      {999, 2, 1000},
      {4, 0, 0},
      {5, 0, 10},
      {50, 0, 100},
      {1'000, 3, 1'000},
      {99'995, 4, 100'000},
      {4'999'999'999'999'999, 1, 5'000'000'000'000'000},
      {10'000'000'000'000'000'000U, 1, 0},
      {10'000'000'000'000'000'000U, 2, 10'000'000'000'000'000'000U},
      {kMax, 20, kMax},
      {kMax, kMax, kMax},
      {kMax, 19, 4},  // 18446744073709551620 wraps
      {kMax, 2, 18'000'000'000'000'000'000U},
      {999'999'999'999'999'999, 18, 1'000'000'000'000'000'000},
      {999'999'999'999'999'999, 0, 0},  // counts as 19 digits
      {600'000'000'000'000'000, 0, 1'000'000'000'000'000'000},
  };
  for (const Case& each : cases) {
    EXPECT_EQ(roundSig(each.x, each.sig), each.rounded) << each.x << " to " << each.sig;
  }
}

constexpr auto kRanges = std::to_array<FieldRange>({{2, "a"}, {1, "b"}, {3, "bin", 9, 11}});
constexpr FieldIndex kIndex(kRanges);
constexpr FieldTable kTable(kRanges, kIndex);

std::vector<std::string> keysOf(const PropertyDict& dict) {
  std::vector<std::string> keys;
  for (const auto& [key, value] : dict) {
    keys.push_back(key);
  }
  return keys;
}

TEST(FilteredDict, keepsListedEntriesInTheOrderOfTheSource) {
  const PropertyDict source = {{"bin10", 12345}, {"c", 7}, {"b", "x"}, {"bin12", 1}, {"a", 12345}};
  const PropertyDict kept = {{"bin10", 12345}, {"b", "x"}, {"a", 12345}};
  EXPECT_EQ(CreateFilteredDict(source, &kTable), kept);
  EXPECT_EQ(CreateFilteredDict_SigDig(source, &kTable, false), kept);
  EXPECT_EQ(keysOf(CreateFilteredDict(source, &kTable)), keysOf(kept));
  const PropertyDict rounded = {{"bin10", 12300}, {"b", "x"}, {"a", 12000}};
  EXPECT_EQ(CreateFilteredDict_SigDig(source, &kTable, true), rounded);

  EXPECT_EQ(CreateFilteredDict(source, nullptr), source);
  EXPECT_EQ(CreateFilteredDict_SigDig(source, nullptr, true), source);
}

TEST(FilteredDict, roundsNumbersOfEveryKindAndNothingElse) {
  struct Case {
    PropertyValue value, rounded;
  };
  const Case cases[] = {
      {std::int8_t{-1}, std::uint64_t{18'000'000'000'000'000'000U}},
      {std::uint32_t{4'294'967'295}, std::uint64_t{4'300'000'000}},
      {12567.9, std::uint64_t{13'000}},
      {true, true},
      {"12345", "12345"},
      {Bytes{1, 2, 3}, Bytes{1, 2, 3}},
      {Date{12345, 0}, Date{12345, 0}},
      {PropertyDict{{"a", 12345}}, PropertyDict{{"a", 12345}}},
      {PropertyArray{12345}, PropertyArray{12345}},
  };
  for (const Case& each : cases) {
    const PropertyDict filtered = CreateFilteredDict_SigDig({{"a", each.value}}, &kTable, true);
    ASSERT_NE(filtered.find("a"), nullptr);
    EXPECT_EQ(*filtered.find("a"), each.rounded);
    if (const Number* number = filtered.find("a")->number()) {
      EXPECT_EQ(number->kind(), NumberKind::UInt64);
    }
  }
}

TEST(UserCapacity, isThePowerOfTwoAboveButFor1536) {
  struct Case {
    std::uint64_t megabytes;
    std::uint32_t gigabytes;
  };
  const Case cases[] = {
      {0, 0},
      {500, 0},
      {1000, 1},
      {1024, 2},
      {121'856, 128},
      {1'376'255, 2048},
      {1'376'256, 1536},
      {1'770'495, 1536},
      {1'770'496, 2048},
      {0x7'0000'0400, 2},
      {0xFFFF'FFFF, 4'194'304},
  };
  for (const Case& each : cases) {
    EXPECT_EQ(GetUserCapacityInGB(each.megabytes), each.gigabytes) << each.megabytes;
  }
}

}  // namespace
}  // namespace vesprun
