#include "config/PrefixTable.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>

namespace vesprun {
namespace {

TEST(PrefixTable, AnswersLikeAScanInOrder) {
  std::mt19937 random(20240305);
  const auto text = [&random](std::string_view letters, std::size_t longest) {
    std::string made(random() % (longest + 1), '\0');
    for (char& c : made) {
      c = letters[random() % letters.size()];
    }
    return made;
  };
  int answered = 0;
  const std::string common = "common to all.";
  for (const std::string& letters : {std::string("ab"), std::string("a.\0\x01\x7F\x80\xFF", 7)}) {
    for (const std::size_t count : {0U, 1U, 10U, 3000U, 3001U}) {
      const std::string begin = count % 2 == 0 ? common : "";
      std::vector<std::string> prefixes;
      for (std::size_t i = 0; i < count; ++i) {
        // The empty prefix, which hides all that follow, comes late.
        const std::string made = text(letters, 9);
        const std::string prefix = begin + (made.empty() && i < count / 2 ? "a" : made);
        if (std::find(prefixes.begin(), prefixes.end(), prefix) == prefixes.end()) {
          prefixes.push_back(prefix);
        }
      }
      const PrefixTable table({prefixes.begin(), prefixes.end()});
      for (int i = 0; i < 500; ++i) {
        const std::string key = (i % 50 == 0 ? "comm" : begin) + text(letters, 12);
        const auto first =
            std::find_if(prefixes.begin(), prefixes.end(),
                         [&](const std::string& prefix) { return key.starts_with(prefix); });
        const std::optional<std::size_t> expected =
            first != prefixes.end() ? std::optional<std::size_t>(first - prefixes.begin())
                                    : std::nullopt;
        ASSERT_EQ(table.find(key), expected) << key;
        answered += expected ? 1 : 0;
      }
    }
  }
  EXPECT_GT(answered, 1000);
}

}  // namespace
}  // namespace vesprun
