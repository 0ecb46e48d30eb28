#include "NANDInfo/FieldTable.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <set>

#include "NANDInfo/EventFields.h"
#include "NANDInfo/FieldSets.h"
#include "NANDInfo/LegacyKeyMap.h"
#include "NANDInfo/MagazineFields.h"
#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"

namespace vesprun {
namespace {

using ::testing::IsEmpty;
using Names = std::set<std::string, std::less<>>;

constexpr auto kRanges = std::to_array<FieldRange>(
    {{1, "step10"}, {2, "step", 12, 14}, {3, "step_2b"}, {4, "step"}, {5, "step", 0, 3}, {6, "7"}});
constexpr FieldIndex kIndex(kRanges);
constexpr FieldTable kTable(kRanges, kIndex);
static_assert(kTable.size() == 11);

TEST(FieldTable, tellsNumbersAndTheirSpellingApart) {
  struct Case {
    const char* name;
    int digits;  ///< 0: not in the table
  };
  const Case cases[] = {
      {"step10", 1},
      {"step11", 0},
      {"step12", 2},
      {"step14", 2},
      {"step15", 0},
      {"step", 4},
      {"step0", 5},
      {"step00", 0},
      {"step3", 5},
      {"step03", 0},
      {"step1", 5},
      {"step_2b", 3},
      {"step_2", 0},
      {"step4294967295", 0},
      {"7", 6},
      {"77", 0},
      {"", 0},
      {"Step", 0},
      {"step18446744073709551616", 0},
      {"step 1", 0},
      {"step_2b0", 0},
      {"ste", 0},
      {"step4294967297", 0},
  };
  for (const Case& each : cases) {
    const FieldRange* range = kTable.find(each.name);
    EXPECT_EQ(range != nullptr ? range->digits : 0, each.digits) << each.name;
  }
}

TEST(FieldTable, findsEveryNameOfEveryTableInItsOwnRange) {
  std::vector<const FieldTable*> tables = {&WhitelistedRawNANDFTLCounters_SigDigDict,
                                           &WhitelistedRawNANDMSPCounters_SigDigDict,
                                           &WhitelistedStorageStats_SigDigDict,
                                           &FTLStats4MSPStats,
                                           &PrivacyApprovedSMagNANDFTLCounters_Accum,
                                           &PrivacyApprovedSMagNANDFTLCounters_Dynamic,
                                           &keyMap};
  for (const EventFields& event : EventHubConfigDetails) {
    tables.push_back(fieldsOfEvent(event.event));
    ASSERT_EQ(tables.back(), event.fields);
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
  EXPECT_EQ(fieldsOfEvent("com.quill.massStorage.NANDInfo.FTLCounters_2"), nullptr);
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

TEST(FieldTable, namesOnlyFieldsThatTheDecodersMake) {
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

TEST(LegacyKeyMap, putsTheSuffixOfTheFieldBehindThePrefix) {
  struct Case {
    const char* field;
    std::optional<std::string> key;
  };
  const Case cases[] = {
      {"numMemChoke", "com.quill.NANDInfo.numMemChoke"},
      {"CacheDepthVsThroughput255", "com.quill.NANDInfo.CacheDepthVsThroughput255"},
      {"CacheDepthVsThroughput256", std::nullopt},
      {"padSizes3", "com.quill.NANDInfo.PadSize4"},
      {"bandsPerSpecialFlow4", "com.quill.NANDInfo.BandsPerInternalFlow3"},
      {"bandsPerSpecialFlow3", std::nullopt},
      {"coldestCycle1", "com.quill.NANDInfo.IntermediateColdestCycle"},
      {"raidReconstructFailPartition0", "com.quill.NANDInfo.raidReconstructFailPartition"},
      {"raidReconstructFailPartition1", "com.quill.NANDInfo.raidReconstructFailPartition1"},
      {"", std::nullopt},
  };
  for (const Case& each : cases) {
    EXPECT_EQ(legacyKeyOf(each.field), each.key) << each.field;
  }
}

}  // namespace
}  // namespace vesprun
