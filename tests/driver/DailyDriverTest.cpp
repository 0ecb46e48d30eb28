#include "driver/DailyDriver.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>

#include <algorithm>
#include <limits>

#include "common/AppInfoList.h"
#include "common/TextForm.h"
#include "driver/ActiveAppInfoListener.h"
#include "driver/DailyTasks.h"
#include "platform/host/messages/HostMainLoop.h"
#include "platform/host/messages/MessageFraming.h"
#include "platform/host/messages/ServiceSocket.h"
#include "support/Documents.h"
#include "support/HostServiceTest.h"
#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

using ::testing::Contains, ::testing::ElementsAreArray, ::testing::IsEmpty, ::testing::SizeIs;

constexpr const char* kService = "com.quill.aggregated.vesprun";
constexpr const char* kStoredDayKey = "LastCrashLogSerializationDateInDaysSince1970";
constexpr std::int32_t kYesterday = TestDevice::kToday - 1;
constexpr double kQuiet = 0.05;

// No report is built, and the day is one without legacy NAND info: what stands in the log is the
// driver's alone. In the device's zone it is still the day before.
constexpr std::string_view kNoSubmission =
    R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "Pacific/Honolulu",
        "submission": {"enabled": false},
        "system": {"buildVersion": "2B"},
        "kernel": {"variables": {"kern.bootsessionuuid": "1"}}})";

/// A device on which the driver has nothing to say about the OS build.
struct DriverDevice : TestDevice {
  DriverDevice() : TestDevice(kNoSubmission) {
    platform().preferences().LGSPreferencesSetValue("LastOSUpdate", PropertyDict{{"version", "2B"}},
                                                    kService);
  }
};

const std::string kUnchanged = "default: Day unchanged since last run";
const std::string kNotified = "default: notified of logging status, waiting for activate app info";
const std::string kNeverReceived =
    "default: never received requested AAI, so moving along without it";
const std::string kTasks = "default: daily tasks for day ";
const std::string kYesterdaysTasks = "default: daily tasks for day 19786";
const std::string kRequested = "default: vesprun got requestedAAI:\n";
const std::string kUnsolicited = "default: vesprun got (unsolicited -- so ignoring) AAI:\n";

PropertyDict operation(std::int64_t number) { return {{"operation", number}}; }

PropertyDict activeApps(PropertyArray apps) {
  return {{"operation", 2}, {"app_data", std::move(apps)}};
}

PropertyDict sampleApp() {
  const Bytes uuid{0, 17, 34, 51, 68, 85, 102, 119, 136, 153, 170, 187, 204, 221, 238, 255};
  return {{"bundle_id", "com.example.a"},
          {"version", "1.2"},
          {"adam_id", std::int64_t{1} << 40},
          {"arch", -2},
          {"uuid", uuid}};
}

const std::string kSampleText =
    "({bundle = com.example.a; version = 1.2; adamID = 1099511627776; arch = -2; "
    "uuid = 00112233-4455-6677-8899-AABBCCDDEEFF})";

class DailyDriverTest : public ::testing::Test {
 protected:
  static std::optional<PropertyValue> storedDay(TestDevice& device) {
    return device.platform().preferences().LGSPreferencesGetValue(kStoredDayKey, kService);
  }

  /// The listener mode while one peer sends these messages at once.
  static void runWithMessages(TestDevice& device, const std::vector<PropertyValue>& messages) {
    FileDescriptor peer;
    auto& loop = dynamic_cast<HostMainLoop&>(device.platform().mainLoop());
    loop.queueWork([&] {
      std::string error;
      peer = connectToService(device.platform().directory(), kService, 5, error);
      std::string bytes;
      for (const PropertyValue& message : messages) {
        bytes += messageFrame(ptreeOf(message)).value();
      }
      EXPECT_EQ(send(peer.get(), bytes.data(), bytes.size(), MSG_NOSIGNAL),
                static_cast<ssize_t>(bytes.size()));
    });
    runListenerMode(kQuiet);
  }
};

TEST_F(DailyDriverTest, OnlyTheFirstArgumentCounts) {
  const struct {
    std::vector<const char*> commandLine;
    std::int64_t storedBefore;
    std::vector<std::string> between;
    std::int64_t storedAfter;
  } kCases[] = {
      {{}, 5, {}, 5},
      {{"vesprun", "-d"}, 5, {kYesterdaysTasks}, kYesterday},
      {{"vesprun", "-d", "-f"}, kYesterday, {kUnchanged}, kYesterday},
      {{"vesprun", "-f", "-d"}, 5, {kYesterdaysTasks}, 5},
      {{"vesprun", "-f"}, kYesterday, {kYesterdaysTasks}, kYesterday},
      {{"vesprun", "-t"}, 5, {kTasks + "19787"}, 5},
      {{"vesprun", "-x", "-d"}, 5, {"default: Unknown arg: -x"}, 5},
      {{"vesprun", "-d "}, 5, {"default: Unknown arg: -d "}, 5},
      {{"vesprun", "%s%n"}, 5, {"default: Unknown arg: %s%n"}, 5},
  };
  for (const auto& [commandLine, before, between, after] : kCases) {
    SCOPED_TRACE(::testing::PrintToString(commandLine));
    DriverDevice device;
    device.platform().preferences().LGSPreferencesSetValue(kStoredDayKey, before, kService);
    runDailyDriver(commandLine);
    std::vector<std::string> expected = between;
    expected.insert(expected.begin(), "default: vesprun started");
    expected.emplace_back("default: vesprun ended");
    EXPECT_THAT(device.log(), ElementsAreArray(expected));
    EXPECT_EQ(storedDay(device), PropertyValue(after));
    EXPECT_THAT(device.names("run"), IsEmpty());
  }
}

TEST_F(DailyDriverTest, TheDayCheckRunsTheTasksOncePerDay) {
  const struct {
    std::optional<PropertyValue> stored;
    bool runs;
  } kCases[] = {
      {std::nullopt, true}, {kYesterday - 30, true},
      {"no number", true},  {(std::int64_t{1} << 32) * -1 + kYesterday, true},
      {kYesterday, false},  {std::numeric_limits<std::int64_t>::max(), false},
  };
  for (const auto& [stored, runs] : kCases) {
    SCOPED_TRACE(stored ? textForm(*stored) : "absent");
    DriverDevice device;
    device.platform().preferences().LGSPreferencesSetValue(kStoredDayKey, stored, kService);
    runDayCheck(nullptr);
    EXPECT_THAT(device.log(), ElementsAreArray({runs ? kYesterdaysTasks : kUnchanged}));
    EXPECT_EQ(storedDay(device), runs ? PropertyValue(kYesterday) : stored);
    device.endProcess();
    device.platform();
    runDayCheck(nullptr);
    EXPECT_EQ(device.log().back(), kUnchanged);
  }
  EXPECT_EQ(dayBefore(std::numeric_limits<std::int32_t>::min()),
            std::numeric_limits<std::int32_t>::max());
}

constexpr std::string_view kTaskDevice =
    R"({"clock": "2024-03-05T09:15:02Z", "system": {"buildVersion": "2B"},
        "channels": [{"name": "c", "value": 3}]})";
const std::string kOSChange = "default: OS change since last run ((null) -> 2B)";

TEST_F(DailyDriverTest, TheTasksReportCountAndSynchronize) {
  TestDevice device(kTaskDevice);
  device.writeWhitelistJson(R"({"G": {"ScalarKeyPrefixes": {"": {}}}})");
  device.platform().tallybook().TBClientAddValueForScalarKey("k", 1);
  const PropertyValue data(PropertyArray{PropertyDict{{"bundle_id", "b"}}});
  const AppInfoList apps(&data);
  runDailyTasks(TestDevice::kToday, &apps);
  ASSERT_THAT(device.documents(), SizeIs(1));
  const PropertyDict document = device.documents()[0];
  EXPECT_EQ(*document.find("TBScalars")->dict()->find("k"), PropertyValue(1));
  EXPECT_EQ((document.end() - 1)->first, "TBActivatedAppInfo");
  EXPECT_EQ(textForm((document.end() - 1)->second),
            "({bundle = b; version = ; adamID = 0; arch = 0; uuid = })");
  EXPECT_EQ(writtenScalars(device, "com.quill.tapline."), (Scalars{{"com.quill.tapline.c", 3}}));
  EXPECT_THAT(device.log(), Contains(kOSChange));
}

TEST_F(DailyDriverTest, MessagesLeadToWhatTheirStateAllows) {
  const PropertyDict apps = activeApps({sampleApp()});
  const PropertyDict noApps = activeApps({});
  const PropertyDict dailyTasks{{"operation", 1}, {"value", (std::int64_t{7} << 32) + 4242}};
  const PropertyDict farOperation{{"operation", (std::int64_t{1} << 32) * -1}};
  using Log = std::vector<std::string>;
  const Log servedEmpty{kNotified, kRequested + "()", kYesterdaysTasks};
  const Log unserved{kNotified, kNeverReceived, kYesterdaysTasks};
  const struct {
    std::vector<PropertyValue> messages;
    Log log;
  } kCases[] = {
      {{}, {}},
      {{operation(0), apps}, {kNotified, kRequested + kSampleText, kYesterdaysTasks}},
      {{operation(0), dailyTasks, noApps}, servedEmpty},
      {{farOperation, PropertyDict{{"operation", (std::int64_t{1} << 40) + 2}}}, servedEmpty},
      {{"text", PropertyArray{operation(3)}, operation(0), noApps}, servedEmpty},
      {{apps, operation(0)},
       {kUnsolicited + kSampleText, kNotified, kNeverReceived, kYesterdaysTasks}},
      {{operation(0), noApps, apps},
       {kNotified, kRequested + "()", kYesterdaysTasks, kUnsolicited + kSampleText}},
      {{operation(0), operation(0)}, unserved},
      {{PropertyDict{}}, unserved},
      {{dailyTasks, operation(0)}, {kTasks + "4242"}},
      {{operation(1)}, {kTasks + "0"}},
      {{operation(3), operation(0)}, {}},
  };
  for (const auto& [messages, log] : kCases) {
    SCOPED_TRACE(textForm(PropertyArray(messages)));
    DriverDevice device;
    runWithMessages(device, messages);
    EXPECT_THAT(device.log(), ElementsAreArray(log));
    const bool notified = std::count(log.begin(), log.end(), kNotified) != 0;
    EXPECT_THAT(device.lines("notifications.jsonl"), SizeIs(notified ? 1 : 0));
    const bool dayChecked = std::count(log.begin(), log.end(), kYesterdaysTasks) != 0;
    EXPECT_EQ(storedDay(device).has_value(), dayChecked);
    EXPECT_THAT(device.names("run"), IsEmpty());
  }
}

TEST_F(DailyDriverTest, AMessageThatFailsStopsNoOther) {
  DriverDevice device;
  auto& loop = dynamic_cast<HostMainLoop&>(device.platform().mainLoop());
  loop.queueWork([] { handlePeerMessage(operation(0)); });
  loop.queueWork([] { throw std::bad_alloc(); });
  loop.queueWork([] { handlePeerMessage(PropertyDict{{"operation", 2}, {"app_data", 0}}); });
  runListenerMode(kQuiet);
  EXPECT_THAT(device.log(), Contains("error: unexpected failure: std::bad_alloc"));
  EXPECT_EQ(storedDay(device), PropertyValue(kYesterday));
}

TEST_F(DailyDriverTest, AWaitForTheDaysWorkOfAnotherProcessEnds) {
  DriverDevice device;
  EXPECT_TRUE(device.platform().fileSystem().lockDailyWork(0));
  EXPECT_TRUE(device.platform().fileSystem().lockDailyWork(0));
  EXPECT_TRUE(hasSucceeded(startProcess([&device] {
    std::string error;
    const std::unique_ptr<HostPlatform> other = HostPlatform::open(device.path(), error);
    EXPECT_FALSE(other->fileSystem().lockDailyWork(0.01));
  })));
  EXPECT_THAT(device.log(),
              ::testing::ElementsAre(::testing::EndsWith(": another process keeps it locked")));
  device.endProcess();
  EXPECT_TRUE(device.platform().fileSystem().lockDailyWork(0));
}

TEST_F(DailyDriverTest, AServiceThatIsTakenChangesNothingElse) {
  DriverDevice device;
  const std::unique_ptr<ServiceListener> other =
      device.platform().messageService().createListener(kService, handlePeerMessage);
  ASSERT_NE(other, nullptr);
  aaiRequested = true;
  runListenerMode(kQuiet);
  EXPECT_THAT(device.log(), ::testing::ElementsAre(::testing::StartsWith("error: "), kNeverReceived,
                                                   kYesterdaysTasks));
  EXPECT_TRUE(device.exists(std::string("run/") + kService));
}

TEST_F(DailyDriverTest, AppsKeepFiveEntriesWhateverIsMissing) {
  PropertyDict odd = sampleApp();
  odd.set("bundle_id", 7);
  odd.set("adam_id", "8");
  odd.set("arch", 2.9);
  odd.set("uuid", Bytes(15, 1));
  const PropertyValue apps(PropertyArray{sampleApp(), "no app", PropertyDict{}, odd});
  const auto listOf = [](const PropertyValue& data) {
    PropertyArray list;
    AppInfoList(&data).forEach([&list](const PropertyDict& app) {
      list.emplace_back(app);
      return true;
    });
    return list;
  };
  const PropertyArray list = listOf(apps);
  ASSERT_THAT(list, SizeIs(3));
  EXPECT_EQ(textForm(PropertyArray{list[0]}), kSampleText);
  EXPECT_EQ(textForm(list[1]), "{bundle = ; version = ; adamID = 0; arch = 0; uuid = }");
  EXPECT_EQ(textForm(list[2]), "{bundle = ; version = 1.2; adamID = 0; arch = 2; uuid = }");
  EXPECT_EQ(list[2].dict()->find("arch")->number()->kind(), NumberKind::Int64);
  const PropertyValue notAnArray(PropertyDict{{"0", sampleApp()}});
  EXPECT_THAT(listOf(notAnArray), IsEmpty());
}

}  // namespace
}  // namespace vesprun
