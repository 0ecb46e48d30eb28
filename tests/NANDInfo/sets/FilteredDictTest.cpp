#include "NANDInfo/sets/FilteredDict.h"

#include <gtest/gtest.h>
#include <limits>

namespace vesprun {
namespace {

TEST(RoundSig, RoundsHalfUpOnTheDigitThatIsCutOff) {
  constexpr std::uint64_t kMax = std::numeric_limits<std::uint64_t>::max();
  constexpr std::uint64_t kE17 = 100'000'000'000'000'000;
  constexpr std::uint64_t kE18 = 10 * kE17;
  constexpr std::uint64_t kBelow = kE18 - 1;
  constexpr std::uint64_t kE19 = 10 * kE18;
  // A sum may wrap, and what is just below 10^18 counts as 19 digits.
  const std::array<std::uint64_t, 3> cases[] = {
      {0, 3, 0},          {4, 0, 0},         {5, 0, 10},           {50, 0, 100},
      {123, 3, 123},      {999, 2, 1000},    {1000, 3, 1000},      {12345, 2, 12000},
      {12499, 2, 12000},  {12500, 2, 13000}, {99'995, 4, 100'000}, {kE19, 1, 0},
      {kE19, 2, kE19},    {kMax, 19, 4},     {kMax, 20, kMax},     {kMax, kMax, kMax},
      {kBelow, 18, kE18}, {kBelow, 0, 0},    {6 * kE17, 0, kE18}};
  EXPECT_EQ(roundSig(kMax, 2), 18 * kE18);
  EXPECT_EQ(roundSig(5 * kE17 - 1, 1), 5 * kE17);
  for (const auto& [x, sig, rounded] : cases) {
    EXPECT_EQ(roundSig(x, sig), rounded) << x << " to " << sig;
  }
}

constexpr auto kListedRanges = std::to_array<FieldRange>({{2, "a"}, {1, "b"}, {3, "bin", 9, 11}});
constexpr FieldTable kListed = fieldTable<kListedRanges>();

std::vector<std::string> keysOf(const PropertyDict& dict) {
  std::vector<std::string> keys;
  for (const auto& [key, value] : dict) {
    keys.emplace_back(key);
  }
  return keys;
}

TEST(FilteredDict, KeepsListedEntriesInTheOrderOfTheSource) {
  const PropertyDict source = {{"bin10", 12345}, {"c", 7}, {"b", "x"}, {"bin12", 1}, {"a", 12345}};
  const PropertyDict kept = {{"bin10", 12345}, {"b", "x"}, {"a", 12345}};
  EXPECT_EQ(CreateFilteredDict(source, &kListed), kept);
  EXPECT_EQ(CreateFilteredDict_SigDig(source, &kListed, false), kept);
  EXPECT_EQ(keysOf(CreateFilteredDict(source, &kListed)), keysOf(kept));
  const PropertyDict rounded = {{"bin10", 12300}, {"b", "x"}, {"a", 12000}};
  EXPECT_EQ(CreateFilteredDict_SigDig(source, &kListed, true), rounded);

  EXPECT_EQ(CreateFilteredDict(source, nullptr), source);
  EXPECT_EQ(CreateFilteredDict_SigDig(source, nullptr, true), source);

  GenericParserCxt fields;
  for (const char* name : {"bin10", "c", "a", "bin12", "bin9", "a"}) {
    fields.append(name, "", 12345);
  }
  for (const bool round : {false, true}) {
    const PropertyDict dict = CreateDictFromCxt(fields);
    for (const FieldTable* table : {&kListed, static_cast<const FieldTable*>(nullptr)}) {
      EXPECT_EQ(CreateFilteredDict_SigDig(fields, table, round),
                CreateFilteredDict_SigDig(dict, table, round));
    }
  }
}

TEST(FilteredDict, RoundsNumbersOfEveryKindAndNothingElse) {
  const std::pair<PropertyValue, PropertyValue> cases[] = {
      {std::int8_t{-1}, std::uint64_t{18'000'000'000'000'000'000U}},
      {std::uint32_t{4'294'967'295}, std::uint64_t{4'300'000'000}},
      {12567.9, std::uint64_t{13'000}},
      {true, true},
      {"12345", "12345"},
      {Bytes{1, 2, 3}, Bytes{1, 2, 3}},
      {Date{12345, 0}, Date{12345, 0}},
      {PropertyDict{{"a", 12345}}, PropertyDict{{"a", 12345}}},
      {PropertyArray{12345}, PropertyArray{12345}}};
  for (const auto& [value, rounded] : cases) {
    const PropertyDict filtered = CreateFilteredDict_SigDig({{"a", value}}, &kListed, true);
    ASSERT_NE(filtered.find("a"), nullptr);
    EXPECT_EQ(*filtered.find("a"), rounded);
    if (const Number* number = filtered.find("a")->number()) {
      EXPECT_EQ(number->kind(), NumberKind::UInt64);
    }
  }
}

}  // namespace
}  // namespace vesprun
