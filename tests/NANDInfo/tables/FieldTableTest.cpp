#include "NANDInfo/tables/FieldTable.h"

#include <gtest/gtest.h>
#include <set>

#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/tables/EventFields.h"
#include "NANDInfo/tables/FieldSets.h"
#include "NANDInfo/tables/LegacyKeyMap.h"
#include "NANDInfo/tables/MagazineFields.h"

namespace vesprun {
namespace {

constexpr auto kRanges = std::to_array<FieldRange>(
    {{1, "step10"}, {2, "step", 12, 14}, {3, "step_2b"}, {4, "step"}, {5, "step", 0, 3}, {6, "7"}});
constexpr FieldTable kTable = fieldTable<kRanges>();

TEST(FieldTable, TellsNumbersAndTheirSpellingApart) {
  const std::pair<int, std::vector<const char*>> cases[] = {
      {1, {"step10"}}, {2, {"step12", "step14"}},        {3, {"step_2b"}},
      {4, {"step"}},   {5, {"step0", "step1", "step3"}}, {6, {"7"}}};
  for (const auto& [digits, names] : cases) {
    for (const char* name : names) {
      ASSERT_NE(kTable.find(name), nullptr) << name;
      EXPECT_EQ(kTable.find(name)->digits, digits) << name;
    }
  }
  for (const char* name :
       {"step11", "step15", "step00", "step03", "step_2", "step_2b0", "step 1", "Step", "ste", "77",
        "", "step4294967295", "step4294967297", "step18446744073709551616"}) {
    EXPECT_EQ(kTable.find(name), nullptr) << name;
  }
}

TEST(FieldTable, FindsEveryNameOfEveryTableInItsOwnRange) {
  std::vector<const FieldTable*> tables = {&WhitelistedRawNANDFTLCounters_SigDigDict,
                                           &WhitelistedRawNANDMSPCounters_SigDigDict,
                                           &PrivacyApprovedSMagNANDFTLCounters_Accum,
                                           &PrivacyApprovedSMagNANDFTLCounters_Dynamic,
                                           &WhitelistedStorageStats_SigDigDict,
                                           &FTLStats4MSPStats,
                                           &keyMap};
  for (const StorageEvent& event : EventHubConfigDetails) {
    tables.push_back(event.fields);
  }
  for (const FieldTable* table : tables) {
    std::set<std::string> names;
    table->forEach([&](std::string_view name, const FieldRange& range) {
      EXPECT_EQ(table->find(name), &range) << name;
      EXPECT_FALSE(table->contains(std::string(name) + "_")) << name;
      names.emplace(name);
    });
    EXPECT_EQ(names.size(), table->size());
  }
}

/// A misspelt name would be in a set and never be sent.
TEST(FieldTable, NamesWhatAStatisticGives) {
  std::set<std::string_view> base, ftl, msp;
  const auto add = [](auto& names, const auto& row, KnownNames known) {
    for (std::size_t i = 0; i < row.count; ++i) {
      names.insert(known.text(i));
    }
  };
  for (const ORUStatKey& row : ORUStatKeyTable) {
    add(base, row, baseNamesOf(row));
    add(ftl, row, FTLNamesOf(row));
  }
  for (const ORUMSPKey& row : ORUMSPKeyTable) {
    add(msp, row, MSPNamesOf(row));
  }
  const std::pair<const FieldTable*, const std::set<std::string_view>*> cases[] = {
      {&WhitelistedRawNANDFTLCounters_SigDigDict, &ftl},
      {&WhitelistedRawNANDMSPCounters_SigDigDict, &msp},
      {&PrivacyApprovedSMagNANDFTLCounters_Accum, &ftl},
      {&PrivacyApprovedSMagNANDFTLCounters_Dynamic, &ftl},
      {&keyMap, &base}};
  for (const auto& [table, names] : cases) {
    table->forEach([names = names](std::string_view name, const FieldRange&) {
      EXPECT_TRUE(name.starts_with("HLT_") || names->contains(name)) << name;
    });
  }
}

TEST(LegacyKeyMap, HasNoKeyForOtherFields) {
  EXPECT_EQ(legacyKeyOf("padSizes3"), "com.quill.NANDInfo.PadSize4");
  for (const char* field : {"CacheDepthVsThroughput256", "bandsPerSpecialFlow3", ""}) {
    EXPECT_EQ(legacyKeyOf(field), std::nullopt) << field;
  }
}

}  // namespace
}  // namespace vesprun
