#include "NANDInfo/tables/FieldTable.h"

#include <gmock/gmock.h>
#include <set>

#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/tables/EventFields.h"
#include "NANDInfo/tables/FieldSets.h"
#include "NANDInfo/tables/LegacyKeyMap.h"
#include "NANDInfo/tables/MagazineFields.h"

namespace vesprun {
namespace {

using ::testing::IsEmpty;
using Names = std::set<std::string, std::less<>>;

constexpr auto kRanges = std::to_array<FieldRange>(
    {{1, "step10"}, {2, "step", 12, 14}, {3, "step_2b"}, {4, "step"}, {5, "step", 0, 3}, {6, "7"}});
constexpr FieldTable kTable = fieldTable<kRanges, 11>();

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
    Names names;
    table->forEach([&](std::string_view name, const FieldRange& range) {
      EXPECT_EQ(table->find(name), &range) << name;
      EXPECT_FALSE(table->contains(std::string(name) + "_")) << name;
      names.emplace(name);
    });
    EXPECT_EQ(names.size(), table->size());
  }
}

template <typename Key>
void addFields(Names& names, const Key& key, const std::string& separator) {
  for (std::uint32_t i = 0; i < key.count; ++i) {
    names.insert(key.count == 1 ? std::string(key.name)
                                : std::string(key.name) + separator + std::to_string(i));
  }
}

/// The names of `table` that no decoder makes and that are no derived figures either.
Names unknownIn(const FieldTable& table, const Names& known) {
  Names unknown;
  table.forEach([&](std::string_view name, const FieldRange&) {
    if (!known.contains(name) && !name.starts_with("HLT_")) {
      unknown.emplace(name);
    }
  });
  return unknown;
}

TEST(FieldTable, NamesOnlyFieldsThatTheDecodersMake) {
  Names base, ftl, msp;
  for (const ORUStatKey& key : ORUStatKeyTable) {
    addFields(base, key, "");
    addFields(ftl, key, "_");
  }
  for (const ORUMSPKey& key : ORUMSPKeyTable) {
    addFields(msp, key, "");
  }
  EXPECT_THAT(unknownIn(WhitelistedRawNANDFTLCounters_SigDigDict, ftl), IsEmpty());
  EXPECT_THAT(unknownIn(WhitelistedRawNANDMSPCounters_SigDigDict, msp), IsEmpty());
  EXPECT_THAT(unknownIn(PrivacyApprovedSMagNANDFTLCounters_Accum, ftl), IsEmpty());
  EXPECT_THAT(unknownIn(PrivacyApprovedSMagNANDFTLCounters_Dynamic, ftl), IsEmpty());
  EXPECT_THAT(unknownIn(keyMap, base), IsEmpty());
}

TEST(LegacyKeyMap, HasNoKeyForOtherFields) {
  EXPECT_EQ(legacyKeyOf("padSizes3"), "com.quill.NANDInfo.PadSize4");
  for (const char* field : {"CacheDepthVsThroughput256", "bandsPerSpecialFlow3", ""}) {
    EXPECT_EQ(legacyKeyOf(field), std::nullopt) << field;
  }
}

}  // namespace
}  // namespace vesprun
