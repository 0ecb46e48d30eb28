#include <algorithm>

#include "common/TextForm.h"
#include "report/KernelMemoryStatistics.h"
#include "report/ReportSources.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre;

/// A started device that whitelists every scalar, unrounded, or none.
class SourceDevice : public TestDevice {
 public:
  explicit SourceDevice(const std::string& entries, bool allKeys = true)
      : TestDevice(R"({"clock": "2024-03-05T09:15:02Z", )" + entries + "}") {
    writeWhitelistJson(allKeys ? R"({"G": {"ScalarKeyPrefixes": {"": {}}}})" : "{}");
  }
};

template <typename Source>
std::string scalarsOf(const Source& source) {
  TBReport report;
  source(report);
  return textForm(report.scalarsOutput());
}

TEST(InstalledAppInfo, IsCountedForTheLogOrForTheEvent) {
  const std::string apps =
      R"("apps": [{"bundle": "a", "user": true}, {"bundle": "b", "user": false}])";
  const std::string unused = R"(, "events": {"used": []})";
  for (const auto& [events, isListed, isCounted] :
       {std::tuple(unused, true, true), {"", false, true}, {unused, false, false}}) {
    SourceDevice device(apps + events, isListed);
    TBReport report;
    EXPECT_EQ(addInstalledAppInfo(report).has_value(), isCounted);
    EXPECT_EQ(report.scalarsOutput().size(), isListed ? 2U : 0U);
  }
}

TEST(Metadata, NamesLanguagesAndRegion) {
  const std::pair<const char*, const char*> kCases[] = {
      {R"({"preferred": ["en-GB", "fr"], "localizations": ["fr", "en"], "country": "GB"})",
       "{TBUserInterfaceLanguage = en; TBPreferredUserInterfaceLanguage = en-GB; "
       "TBUserSetRegionFormat = GB}"},
      {R"({"preferred": ["xx"], "localizations": ["en"], "country": null})",
       "{TBUserInterfaceLanguage = <unknown>; TBPreferredUserInterfaceLanguage = xx}"},
      {R"({"preferred": [], "localizations": ["en"], "country": null})",
       "{TBUserInterfaceLanguage = <unknown>; TBPreferredUserInterfaceLanguage = <unknown>}"},
  };
  for (const auto& [languages, expected] : kCases) {
    SourceDevice device(std::string("\"languages\": ") + languages);
    PropertyDict metadata;
    addMetadataKeys(metadata);
    EXPECT_EQ(textForm(metadata), expected);
  }
}

TEST(DatabaseStatistics, TakeTheCorruptionCountOnce) {
  const auto takeDatabaseSize = [](TBReport& report) {
    if (reportDatabaseSize(report)) {
      restartCorruptionCount();
    }
  };
  const auto expected = [](int mebibytes, int count) {
    return "{com.quill.logsmith.tlyd.database.size = " + std::to_string(mebibytes) +
           "; com.quill.logsmith.tlyd.database.corruptions = " + std::to_string(count) + "}";
  };
  const std::pair<const char*, std::vector<std::string>> kCases[] = {
      {"{}", {}},
      {R"({"available": false})",
       {"error: Failed to dynamically load the FaultlineSupport framework"}},
      {R"({"missing": ["LGSPreferencesGetIntegerValue", "LGSPreferencesSetValue"]})",
       {"error: Failed to dyanmically link LGSPreferencesGetIntegerValue",
        "error: Failed to dynamically link LGSPreferencesSetValue"}}};
  for (const auto& [library, log] : kCases) {
    SourceDevice device(std::string("\"supportLibrary\": ") + library);
    const auto count = [&] {
      return device.platform().preferences().LGSPreferencesGetIntegerValue(
          "DatabaseCorruptionCount", "com.quill.aggregated");
    };
    const auto setCount = [&](int corruptions) {
      device.platform().preferences().LGSPreferencesSetValue("DatabaseCorruptionCount", corruptions,
                                                             "com.quill.aggregated");
    };
    setCount(3);
    EXPECT_EQ(scalarsOf(takeDatabaseSize), expected(-1, log.empty() ? 3 : 0));
    EXPECT_EQ(count(), log.empty() ? 0 : 3);
    EXPECT_EQ(device.log(), log);
    device.write("var/mobile/Library/Tallybook/TBDataStore.sqlitedb", std::string(3 << 20, 'x'));
    setCount(4);
    EXPECT_EQ(scalarsOf(takeDatabaseSize), expected(3, log.empty() ? 4 : 0));
    EXPECT_EQ(device.log().size(), 2 * log.size());
  }
}

TEST(CpuUptime, IsInMinutesAwake) {
  const std::pair<const char*, const char*> kCases[] = {
      {R"({"value": 600000000000, "numerator": 1, "denominator": 1})", "10"},
      {R"({"value": 1439999999999, "numerator": 125, "denominator": 3})", "999"},
      {R"({"value": 18446744073709551615, "numerator": 4294967295, "denominator": 1})",
       "1320469374930293248"},
      {R"({"value": 5, "numerator": 1, "denominator": 0})", "-1"},
      {"null", "-1"}};
  for (const auto& [ticks, expected] : kCases) {
    SourceDevice device(std::string(R"("kernel": {"ticks": )") + ticks + "}");
    EXPECT_EQ(scalarsOf(reportCPUUptime),
              "{com.quill.usage.cur_boot_session_cpu_uptime = " + std::string(expected) + "}");
    EXPECT_EQ(device.log().size(), std::string(expected) == "-1" ? 1U : 0U);
  }
}

/// The rows of memory statistics with these kernel variables, keys without "com.quill.".
std::vector<std::string> memoryStatistics(const std::string& variables) {
  SourceDevice device(R"("kernel": {"pageSize": 16384, "variables": {)" + variables + "}}");
  TBReport report;
  reportVMStats(report);
  std::vector<std::string> rows;
  for (const auto& [key, value] : report.scalarsOutput()) {
    rows.push_back(key.substr(std::string_view("com.quill.").size()) + ' ' + textForm(value));
  }
  return rows;
}

TEST(KernelMemoryStatistics, StandInTheLogOnceTheirGatesHold) {
  const std::string swap = R"("vm.swapusage": {"u32": 1})";
  const std::vector<std::string> always = memoryStatistics(swap);
  EXPECT_THAT(always,
              ElementsAre("kernel.memorystatus_freeze_count 4294967295",
                          "kernel.memorystatus_freeze_budget_pages_remaining -1",
                          "kernel.memorystatus_thaw_count 4294967295", "kernel.swapusage -1",
                          "memorystatus_freezer_thaw_percentage -1"));
  const std::string refreezes = R"("kern.memorystatus_freezer_refreeze_count": {"u64": )";
  const std::string pageouts = R"("kern.memorystatus_freeze_pageouts": {"u64": )";
  const std::pair<std::string, std::string> kCases[] = {
      {R"("vm.vmtc_total": {"u32": 0})", ""},
      {R"("vm.vmtc_total": {"u64": 1})", ""},
      {refreezes + "9}", ""},
      {refreezes + "18446744073709551615}", ""},
      {refreezes + "10}", "memorystatus_freezer_refreeze_average 1844674407370955161 "},
      {pageouts + "65535}", "kernel.memorystatus_freeze_pageouts 65535 "},
      {pageouts + "65536}",
       "kernel.memorystatus_freeze_pageouts 65536 "
       "memorystatus_freezer_thaws_per_gb 9223372036854775807 "},
      {R"("kern.memorystatus_freezer_below_threshold_count": {"u64": 0},
          "kern.memorystatus_freezer_skipped_full_count": {"u64": 0})",
       "memorystatus_freezer_skipped_full_count 0 "}};
  for (const auto& [variables, expected] : kCases) {
    std::string added;
    for (const std::string& row : memoryStatistics(swap + ", " + variables)) {
      added += std::find(always.begin(), always.end(), row) == always.end() ? row + ' ' : "";
    }
    EXPECT_EQ(added, expected) << variables;
  }
}

}  // namespace
}  // namespace vesprun
