#include "vesprun/PropertyValue.h"

#include <gtest/gtest.h>
#include <array>
#include <cmath>
#include <limits>
#include <set>
#include <string>

#include "common/KeyHash.h"
#include "common/TextForm.h"

namespace vesprun {
namespace {

constexpr std::int64_t kMin = std::numeric_limits<std::int64_t>::min();
constexpr std::int64_t kMax = std::numeric_limits<std::int64_t>::max();
constexpr std::uint64_t kAllOnes = std::numeric_limits<std::uint64_t>::max();

TEST(Number, TruncationSaturates) {
  EXPECT_EQ(saturatingTruncate(-0.9), 0);
  EXPECT_EQ(saturatingTruncate(2.9), 2);
  EXPECT_EQ(saturatingTruncate(-2.9), -2);
  EXPECT_EQ(saturatingTruncate(9223372036854775807.0), kMax);
  EXPECT_EQ(saturatingTruncate(std::nextafter(9223372036854775808.0, 0)), 9223372036854774784);
  EXPECT_EQ(saturatingTruncate(-9223372036854775808.0), kMin);
  EXPECT_EQ(saturatingTruncate(-1e300), kMin);
  EXPECT_EQ(saturatingTruncate(std::nan("")), 0);
}

TEST(Number, ReadsAsOtherTypesByTheLowBits) {
  EXPECT_EQ(Number(std::int8_t{-1}).asUInt64(), kAllOnes);
  EXPECT_EQ(Number(std::uint32_t{0xFFFFFFFF}).asInt32(), -1);
  EXPECT_EQ(Number(std::uint32_t{0xFFFFFFFF}).asInt64(), 4294967295);
  EXPECT_EQ(Number(std::int64_t{0x100000002}).asInt32(), 2);
  EXPECT_EQ(Number(kAllOnes).asDouble(), 18446744073709551616.0);
  EXPECT_EQ(Number(1e19).asUInt64(), 10000000000000000000U);
  EXPECT_EQ(Number(1e30).asUInt64(), kAllOnes);
  EXPECT_EQ(Number(-1.5).asUInt64(), kAllOnes);
  EXPECT_EQ(Number(-1e30).asInt32(), 0);
}

TEST(Number, EqualsByValue) {
  EXPECT_EQ(Number(std::int8_t{5}), Number(5.0));
  EXPECT_EQ(Number(kMin), Number(-9223372036854775808.0));
  EXPECT_EQ(Number(std::int32_t{0}), Number(-0.0));
  EXPECT_NE(Number(std::int64_t{-1}), Number(kAllOnes));
  EXPECT_NE(Number(kMax), Number(9223372036854775808.0));
  EXPECT_NE(Number(kAllOnes), Number(18446744073709551616.0));
  EXPECT_NE(Number(std::nan("")), Number(std::nan("")));
}

TEST(PropertyDict, KeepsThePlaceOfAKey) {
  PropertyDict dict{{"b", 1}, {"a", 2}, {"c", 3}};
  dict.set("b", "replaced");
  dict.remove("a");
  dict.merge({{"c", true}, {"a", 4}});
  EXPECT_FALSE(dict.remove("absent"));
  EXPECT_EQ(textForm(dict), "{b = replaced; c = 1; a = 4}");
  EXPECT_EQ(dict, (PropertyDict{{"a", 4}, {"b", "replaced"}, {"c", true}}));
  EXPECT_NE(dict, (PropertyDict{{"a", 4}, {"b", "replaced"}, {"c", 1}}));
}

TEST(PropertyDict, KeepsTheOrderOfManyKeysThroughCopiesAndRemovals) {
  PropertyDict dict;
  for (int i = 0; i < 30; ++i) {
    dict.set(std::to_string(i), -1);
    dict.set(std::to_string(i / 2), i / 2);
    ASSERT_EQ(PropertyDict(dict), dict);
  }
  int at = 0;
  for (const auto& [key, value] : dict) {
    EXPECT_EQ(key, std::to_string(at));
    EXPECT_EQ(value, PropertyValue(at < 15 ? at : -1));
    ++at;
  }
  PropertyDict moved = std::move(dict);
  for (int i = 29; i >= 0; --i) {
    EXPECT_EQ(moved.begin()->first, "0");
    EXPECT_TRUE(moved.remove(std::to_string(i)));
    EXPECT_FALSE(moved.contains(std::to_string(i)));
  }
  EXPECT_EQ(moved, PropertyDict());
}

// All have the same hash where each eight bytes are multiplied by one known factor.
TEST(KeyHash, TellsApartKeysThatWereChosenToCollide) {
  std::set<std::size_t> hashes;
  for (unsigned choice = 0; choice < 4096; ++choice) {
    std::array<std::uint64_t, 24> words{};
    for (unsigned pair = 0; pair < 12; ++pair) {
      if ((choice >> pair & 1) != 0) {
        words[2 * pair] = std::uint64_t{1} << 63;
        words[2 * pair + 1] = std::uint64_t{1} << 63 | std::uint64_t{1} << 31;
      }
    }
    hashes.insert(KeyHash()({reinterpret_cast<const char*>(words.data()), sizeof words}));
  }
  EXPECT_EQ(hashes.size(), 4096U);
}

TEST(PropertyValue, CopiesWhatItHolds) {
  PropertyArray all{PropertyDict{},  PropertyDict{{"k", PropertyArray{1}}},
                    PropertyArray{}, "",
                    "text",          Bytes{},
                    Bytes{1},        Date{},
                    Date{1, 2},      0,
                    false,           true};
  const PropertyArray copy = all;
  for (std::size_t i = 0; i < all.size(); ++i) {
    for (std::size_t j = 0; j < all.size(); ++j) {
      EXPECT_EQ(all[i] == copy[j], i == j) << i << ' ' << j;
    }
  }
  all[0].dict()->set("new", 1);
  EXPECT_EQ(all[0], PropertyValue(PropertyDict{{"new", 1}}));
  EXPECT_TRUE(copy[0].dict()->empty());
  all[4] = std::move(all[1]);
  EXPECT_EQ(all[4], copy[1]);
  all[4] = copy[6];
  EXPECT_EQ(*all[4].data(), Bytes{1});
  EXPECT_EQ(all[4].string(), nullptr);
}

TEST(TextForm, WritesEachType) {
  EXPECT_EQ(textForm(PropertyArray{"a", 7, -1.0, 0.25F, false}), "(a, 7, -1, 0.25, 0)");
  EXPECT_EQ(textForm(Bytes{0x0A, 0xFF}), "<0aff>");
  EXPECT_EQ(textForm(Date{1709630102, 500'000'000}), "2024-03-05 09:15:02 +0000");
  EXPECT_EQ(textForm(kAllOnes), "18446744073709551615");
  EXPECT_EQ(textForm(PropertyDict()), "{}");
  const double infinity = std::numeric_limits<double>::infinity();
  EXPECT_EQ(
      textForm(PropertyArray{1e5, 0.1, 0.1F, 1e16, 1e22, 1e-5, -infinity, infinity, -std::nan("")}),
      "(100000, 0.1, 0.1, 10000000000000000, 1e+22, 1e-05, -inf, inf, nan)");
}

}  // namespace
}  // namespace vesprun
