#include "common/TextForm.h"
#include "platform/host/counters/CounterStore.h"
#include "platform/host/counters/HostTallybook.h"
#include "report/TBReport.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::Contains, ::testing::IsEmpty;

constexpr const char* kDomain = "com.quill.aggregated.vesprun";
constexpr std::int32_t kYesterday = TestDevice::kToday - 1;

/// A device that whitelists "s" (two digits) and "d" (intervals 10) and has counted both, and that
/// has other whitelisted keys on one day alone.
class DailyLogTest : public ::testing::Test {
 protected:
  void start(const char* fails) {
    std::string description = R"({
        "clock": "2024-03-05T09:15:02Z", "events": {"used": []}, "apps": [],
        "system": {"osVersion": "Vesper 2"}, "submission": {"fails": ?},
        "languages": {"preferred": ["en"], "localizations": ["en"], "country": "IE"}})";
    device.emplace(description.replace(description.find('?'), 1, fails));
    device->writeWhitelistJson(R"({"G": {
        "ScalarKeys": {"s": {"sig_fig": 2}}, "ScalarKeyPrefixes": {"day.": {}},
        "DistributionKeys": {"d": {"intervals": [10]}}, "DistributionKeyPrefixes": {"day.": {}}}})");
    preferences = &device->platform().preferences();
  }
  void count() {
    std::string error;
    const auto work = [](CounterStore& store) {
      for (std::int32_t day = kYesterday - 2; day <= kYesterday + 1; ++day) {
        store.setScalar(day, "s", 12345 + 2000 * (day - kYesterday));
        store.setScalar(day, "unlisted", 1);
        const Sample sample{2.5 * (kYesterday + 2 - day), 0};
        store.appendSamples(day, "d", {&sample, 1});
        const std::string onlyThatDay = "day." + std::to_string(day - kYesterday);
        store.setScalar(day, onlyThatDay, 1);
        store.appendSamples(day, onlyThatDay, {&sample, 1});
      }
      return true;
    };
    ASSERT_TRUE(device->platform().counters().write(work, error)) << error;
  }
  static void write(const AppInfoList* appInfo = nullptr, std::int32_t day = kYesterday) {
    TBReport().writeLogForYesterdayWithAppInfo(day, appInfo);
  }
  std::optional<PropertyValue> lastOSVersion() {
    return preferences->LGSPreferencesGetValue("LastOSVersion", kDomain);
  }

  Preferences* preferences = nullptr;
  std::optional<TestDevice> device;
};

TEST_F(DailyLogTest, HoldsItsEntriesInOrder) {
  start("false");
  count();
  write();
  ASSERT_EQ(device->documents().size(), 1U);
  EXPECT_EQ(textForm(device->documents()[0]),
            "{TBCrashLogVersion = 1; TBStartDate = 2024-03-04 00:00:00 +0000; "
            "TBLogCreationDate = 2024-03-05 09:15:02 +0000; "
            "TBMetadata = {TBUserInterfaceLanguage = en; TBPreferredUserInterfaceLanguage = en; "
            "TBUserSetRegionFormat = IE}; TBScalars = {day.-1 = 1; s = 12000; day.0 = 1}; "
            "TBDistributions = {d = (5, 5, 5, 0, 1); day.-1 = (7.5, 7.5, 7.5, 0, 1); "
            "day.0 = (5, 5, 5, 0, 1)}; "
            "TBDistributionsHistogram = {d = {(-inf, 10] = 1}}; TBTasking = (); "
            "TBTaskID = (no tasking id); TBTaskDigest = (no tasking digest); "
            "TBWhitelistDigest = " +
                TBConfig::init()->configFileDigest() + "}");
  EXPECT_THAT(device->log(), Contains("info: writing aggregated log. yesterday=19786"));

  preferences->LGSPreferencesSetValue("TaskingID", "id", kDomain);
  preferences->LGSPreferencesSetValue("TaskingDigest", Bytes{1}, kDomain);
  preferences->LGSPreferencesSetValue("TaskingPayload", PropertyArray{PropertyDict{{"a", 1}}},
                                      kDomain);
  const PropertyValue data(PropertyArray{PropertyDict{{"bundle_id", "b"}}});
  const AppInfoList apps(&data);
  write(&apps);
  const PropertyDict second = device->documents().back();
  EXPECT_EQ(textForm(*second.find("TBTaskID")), "id");
  EXPECT_EQ(textForm(*second.find("TBTaskDigest")), "<01>");
  EXPECT_EQ(textForm(*second.find("TBTasking")), "({a = 1})");
  EXPECT_EQ((second.end() - 1)->first, "TBActivatedAppInfo");
  EXPECT_EQ(textForm((second.end() - 1)->second),
            "({bundle = b; version = ; adamID = 0; arch = 0; uuid = })");
}

TEST_F(DailyLogTest, NamesAPreviousOSVersionOnceThereIsALog) {
  start("false");
  write();
  EXPECT_THAT(device->names("outbox/logs"), IsEmpty());
  EXPECT_EQ(lastOSVersion(), std::nullopt);
  count();
  write(nullptr, std::numeric_limits<std::int32_t>::min());
  EXPECT_THAT(device->names("outbox/logs"), IsEmpty());
  write();
  write();
  preferences->LGSPreferencesSetValue("LastOSVersion", "Vesper 1", kDomain);
  write();
  const std::string first = "outbox/logs/0001-193-log-aggregated";
  const std::string third = "outbox/logs/0003-193-log-aggregated";
  EXPECT_EQ(device->read(first + ".header.json"), "{\"previous_os_version\":\"<unknown>\"}\n");
  EXPECT_EQ(device->read(third + ".header.json"), "{\"previous_os_version\":\"Vesper 1\"}\n");
  EXPECT_EQ(device->names("outbox/logs").size(), 5U);
  EXPECT_THAT(device->read("var/mobile/Library/Preferences/com.quill.aggregated.vesprun.ptree"),
              ::testing::HasSubstr("Vesper 2"));
}

TEST_F(DailyLogTest, SurvivesARefusedSubmissionAndDocument) {
  start("true");
  count();
  const PropertyValue data(PropertyArray{PropertyDict{{"bundle_id", "\x01"}}});
  const AppInfoList unwritable(&data);
  write(&unwritable);
  EXPECT_THAT(device->log().back(),
              ::testing::StartsWith("error: Could not create aggregated ptree: "));
  EXPECT_EQ(lastOSVersion(), std::nullopt);
  write();
  EXPECT_EQ(device->log().back(), "error: Failed to write aggregated log");
  EXPECT_EQ(lastOSVersion(), PropertyValue("Vesper 2"));
  EXPECT_THAT(device->documents(), IsEmpty());
}

}  // namespace
}  // namespace vesprun
