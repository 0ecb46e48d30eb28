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
  for (const std::string& letters : {std::string("ab"), std::string("a.\x01\x7F\x80\xFF")}) {
    for (const std::size_t count : {0U, 1U, 10U, 3000U}) {
      PropertyDict prefixes;
      for (std::size_t i = 0; i < count; ++i) {
        // The empty prefix, which hides all that follow, comes late.
        const std::string prefix = text(letters, 9);
        prefixes.set(prefix.empty() && i < count / 2 ? "a" : prefix, PropertyDict());
      }
      const PrefixTable table(prefixes);
      for (int i = 0; i < 500; ++i) {
        const std::string key = text(letters, 12);
        const PrefixTable::Entry* entry = table.find(key);
        const auto first = std::find_if(prefixes.begin(), prefixes.end(), [&](const auto& prefix) {
          return key.starts_with(prefix.first);
        });
        ASSERT_EQ(entry != nullptr, first != prefixes.end()) << key;
        ASSERT_TRUE(entry == nullptr || entry->first == first->first) << key << entry->first;
        answered += entry != nullptr ? 1 : 0;
      }
    }
  }
  EXPECT_GT(answered, 1000);
}

}  // namespace
}  // namespace vesprun
