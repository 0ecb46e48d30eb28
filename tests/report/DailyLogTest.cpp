#include "common/TextForm.h"
#include "platform/host/counters/CounterStore.h"
#include "platform/host/counters/HostTallybook.h"
#include "report/LogSubmission.h"
#include "report/TBReport.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::IsEmpty;

constexpr const char* kDomain = "com.quill.aggregated.vesprun";
constexpr std::int32_t kYesterday = TestDevice::kToday - 1;

/// A device that whitelists "s", and whose submissions fail or not.
class DailyLogTest : public ::testing::Test {
 protected:
  void start(const char* fails) {
    std::string description = R"({
        "clock": "2024-03-05T09:15:02Z", "events": {"used": []}, "apps": [],
        "system": {"osVersion": "Vesper 2"}, "submission": {"fails": ?},
        "languages": {"preferred": ["en"], "localizations": ["en"], "country": "IE"}})";
    device.emplace(description.replace(description.find('?'), 1, fails));
    device->writeWhitelistJson(R"({"G": {"ScalarKeys": {"s": {}}}})");
    preferences = &device->platform().preferences();
  }
  void count() {
    std::string error;
    const auto work = [](CounterStore& store) {
      store.setScalar(kYesterday, "s", 1);
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
  EXPECT_FALSE(submitDailyLog({}, &unwritable));
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
