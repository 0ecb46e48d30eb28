#include "telemetry/DataUsage.h"

#include <filesystem>
#include <thread>

#include "platform/host/counters/HostTallybook.h"
#include "support/Documents.h"
#include "support/HostServiceTest.h"
#include "telemetry/ReportingChannels.h"
#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

using namespace std::chrono_literals;
using testing::ElementsAre;

constexpr const char* kDomain = "com.quill.logsmith.vesprun";
constexpr const char* kToday = "2024-03-05T00:00:00.5Z";
constexpr const char* kYesterday = "2024-03-04T00:00:00Z";
constexpr const char* kLongAgo = "2024-03-03T23:59:59Z";

std::string record(const std::string& name, const std::string& since, const std::string& counters) {
  return "{" + name + R"(, "since": {"date": ")" + since + "\"}, " + counters + "}";
}

std::string counters(std::int64_t wifiIn, std::int64_t wifiOut, std::int64_t wwanIn,
                     std::int64_t wwanOut) {
  return R"("wifiInBytes": )" + std::to_string(wifiIn) + R"(, "wifiOutBytes": )" +
         std::to_string(wifiOut) + R"(, "wwanInBytes": )" + std::to_string(wwanIn) +
         R"(, "wwanOutBytes": )" + std::to_string(wwanOut);
}

std::string usage(const std::string& records, const char* delay = "0") {
  return deviceWith(R"("usage": {"records": [)" + records + R"(], "delaySeconds": )" + delay + "}");
}

const std::string kApp = R"("bundleName": "app")";
const std::string kProcess = R"("procName": "daemon")";

std::optional<PropertyValue> baseline(TestDevice& device) {
  return device.platform().preferences().LGSPreferencesGetValue("netUsageBaseline", kDomain);
}

void setBaseline(TestDevice& device, const std::string& json) {
  device.platform().preferences().LGSPreferencesSetValue("netUsageBaseline", valueOfJson(json),
                                                         kDomain);
}

std::string jsonOf(const std::optional<PropertyValue>& value) {
  return value ? jsonText(*value) : "none";
}

struct Case {
  const char* what;
  const char* baseline;
  std::string records;
  Scalars added;  ///< keys without "datausage."
  std::string after;
};

TEST(DataUsage, AddsTheGrowthSinceTheBaseline) {
  const std::string minimum = "-9223372036854775808";
  const Case cases[] = {
      {"growth, in whole kilobytes",
       R"({"app": [{"date": "2024-03-05T00:00:00.5Z"}, 100, 100, 100, 100]})",
       record(kApp, kToday, counters(5100, 1123, 1124, 100)),
       {{"wifiInKB.app", 4}, {"wwanInKB.app", 1}},
       R"({"app":[{"date":"2024-03-05T00:00:00.5Z"},5100,1123,1124,100]})"},
      {"backwards",
       R"({"app": [{"date": "2024-03-03T23:59:59Z"}, 100, 5000, 0, 9]})",
       record(kApp, kLongAgo, counters(90, 0, 2048, 9)),
       {{"baddata.app", 2}, {"wwanInKB.app", 2}},
       R"({"app":[{"date":"2024-03-03T23:59:59Z"},90,0,2048,9]})"},
      {"another start, today; a process keeps its bare name in the baseline",
       R"({"daemon": [{"date": "2024-03-05T00:00:00Z"}, 1, 1, 1, 9999], "gone": []})",
       record(kProcess, kToday, counters(1023, 0, -1024, 2048)),
       {{"wwanInKB.com.quill.daemon", -1}, {"wwanOutKB.com.quill.daemon", 2}},
       R"({"daemon":[{"date":"2024-03-05T00:00:00.5Z"},1023,0,-1024,2048]})"},
      {"a start yesterday counts in full, an earlier one does not",
       "{}",
       record(kApp, kYesterday, counters(4096, 0, 0, 0)) + "," +
           record(kProcess, kLongAgo, counters(4096, 0, 0, 0)),
       {{"wifiInKB.app", 4}, {"olddata.com.quill.daemon", 1}},
       R"({"app":[{"date":"2024-03-04T00:00:00Z"},4096,0,0,0],)"
       R"("daemon":[{"date":"2024-03-03T23:59:59Z"},4096,0,0,0]})"},
      {"short and odd baseline entries",
       R"({"app": [{"date": "2024-03-03T23:59:59Z"}, 1024, "x"], "daemon": [7]})",
       record(kApp, kLongAgo, counters(1024, 1024, 2048, 3072)) + "," +
           record(kProcess, kLongAgo, counters(1, 1, 1, 1)),
       {{"wifiOutKB.app", 1},
        {"wwanInKB.app", 2},
        {"wwanOutKB.app", 3},
        {"olddata.com.quill.daemon", 1}},
       R"({"app":[{"date":"2024-03-03T23:59:59Z"},1024,1024,2048,3072],)"
       R"("daemon":[{"date":"2024-03-03T23:59:59Z"},1,1,1,1]})"},
      {"records without a name or a date, with both names, without counters; not a record",
       "\"not a dictionary\"",
       "7," + record(R"("other": 1)", kToday, counters(4096, 0, 0, 0)) + R"(,{"procName": "x"},)" +
           record(kApp + "," + kProcess, kToday, R"("wwanOutBytes": 2048)"),
       {{"wwanOutKB.app", 2}},
       R"({"app":[{"date":"2024-03-05T00:00:00.5Z"},0,0,0,2048]})"},
      {"counters as far apart as can be",
       R"({"app": [{"date": "2024-03-05T00:00:00.5Z"}, 9223372036854775807, 1, 0, 0]})",
       record(kApp, kToday, R"("wifiInBytes": )" + minimum + R"(, "wifiOutBytes": )" + minimum),
       {{"wifiOutKB.app", 9007199254740991}},
       R"({"app":[{"date":"2024-03-05T00:00:00.5Z"},)" + minimum + "," + minimum + ",0,0]}"},
      {"an empty reply", R"({"app": [1]})", "", {}, "{}"},
  };
  for (const Case& c : cases) {
    TestDevice device(usage(c.records));
    setBaseline(device, c.baseline);
    CollectDataUsage();
    Scalars expected;
    for (const auto& [key, value] : c.added) {
      expected["datausage." + key] = value;
    }
    EXPECT_EQ(todaysScalars(device), expected) << c.what;
    EXPECT_EQ(jsonOf(baseline(device)), c.after) << c.what;
    EXPECT_EQ(device.read("outbox/log.jsonl"), "") << c.what;
    EXPECT_TRUE(device.exists("var/mobile/Library/Preferences/" + std::string(kDomain) + ".ptree"));
  }
}

TEST(DataUsage, ALateReplyIsHandledWhileTheStepGoesOn) {
  TestDevice device(deviceWith(R"("channels": [{"name": "a", "value": 1}],
      "usage": {"records": [)" +
                               record(kApp, kToday, counters(2048, 0, 0, 0)) +
                               R"(], "delaySeconds": 0.5})"));
  CollectDataUsage(1ms);
  EXPECT_THAT(device.log(), ElementsAre("default: Murmur timed out, no datausage available"));
  for (int i = 0; i < 2000 && todaysScalars(device, "datausage.").empty(); ++i) {
    LogTaplineChannelScalars();
    device.platform().tallybook().TBClientCheckpoint();
    std::this_thread::sleep_for(5ms);
  }
  EXPECT_EQ(jsonOf(baseline(device)), R"({"app":[{"date":"2024-03-05T00:00:00.5Z"},2048,0,0,0]})");
  EXPECT_EQ(todaysScalars(device, "datausage."), (Scalars{{"datausage.wifiInKB.app", 2}}));
}

TEST(DataUsage, AReplyThatNeverComesOrAfterTheEndIsGivenUp) {
  for (const std::string& description :
       {deviceWith(R"("usage": null)"),
        usage(record(kApp, kToday, counters(2048, 0, 0, 0)), "3600")}) {
    TestDevice device(description);
    setBaseline(device, R"({"app": []})");
    CollectDataUsage(1ms);
    EXPECT_THAT(device.log(), ElementsAre("default: Murmur timed out, no datausage available"));
    const auto end = std::chrono::steady_clock::now();
    device.endProcess();
    EXPECT_LT(std::chrono::steady_clock::now() - end, 60s);
    EXPECT_EQ(todaysScalars(device), Scalars{});
    EXPECT_EQ(jsonOf(baseline(device)), R"({"app":[]})");
  }
}

TEST(DataUsage, AReplyAtTheEndIsHandledWholeOrNotAtAll) {
  for (int i = 0; i < 20; ++i) {
    TestDevice device(
        usage(record(kApp, kToday, counters(2048, 0, 0, 0)), i % 2 == 0 ? "0" : "1e-4"));
    CollectDataUsage(0ns);
    device.endProcess();
    const bool handled = baseline(device).has_value();
    EXPECT_EQ(todaysScalars(device).size(), handled ? 1U : 0U);
  }
}

/// A process of its own that collects and is killed before any service has ended.
void collectAndDie(TestDevice& device) {
  device.platform();
  CollectDataUsage(5s);
  _exit(0);
}

const Scalars kGrowth{{"datausage.wifiInKB.app", 4}};

TEST(DataUsage, GrowthIsCountedOnceWhateverIsKilledInBetween) {
  TestDevice device(usage(record(kApp, kToday, counters(7096, 0, 0, 0))));
  const std::string before = R"({"app":[{"date":"2024-03-05T00:00:00.5Z"},3000,0,0,0]})";
  const std::string after = R"({"app":[{"date":"2024-03-05T00:00:00.5Z"},7096,0,0,0]})";
  setBaseline(device, before);
  device.platform().preferences().LGSPreferencesSynchronize(kDomain);
  std::string error;
  EXPECT_FALSE(device.platform().counters().write(
      [&](CounterStore&) {  // which is locked meanwhile: the counters cannot become durable
        EXPECT_TRUE(hasSucceeded(startProcess([&] {
          device.endProcess();
          collectAndDie(device);
        })));
        return false;
      },
      error));
  EXPECT_EQ(device.read("outbox/log.jsonl"), "") << "the wait for the database is not the reply's";
  device.endProcess();
  EXPECT_EQ(jsonOf(baseline(device)), after);
  EXPECT_EQ(todaysScalars(device), Scalars{});
  device.endProcess();
  const std::string preferences = "var/mobile/Library/Preferences/" + std::string(kDomain);
  const std::string marked = device.read(preferences + ".ptree");

  // As long as the counters have no room, or cannot be read, the mark stays.
  {
    const FileSizeLimit limit(4096);
    device.platform();
    CollectDataUsage();
    device.endProcess();
  }
  const std::string database = "var/mobile/Library/Tallybook/TBDataStore.sqlitedb";
  std::filesystem::rename(device.path(database), device.path("aside"));
  device.write(database + "/folder", "");
  device.platform();
  CollectDataUsage();
  device.endProcess();
  std::filesystem::remove_all(device.path(database));
  std::filesystem::rename(device.path("aside"), device.path(database));

  device.platform();
  CollectDataUsage();
  EXPECT_EQ(todaysScalars(device), kGrowth);
  EXPECT_EQ(jsonOf(baseline(device)), after);
  device.endProcess();
  EXPECT_THAT(device.read(preferences + ".ptree"), testing::Not(testing::HasSubstr("Mark")));

  // Killed when the counters were durable already.
  device.write(preferences + ".ptree", marked);
  device.platform();
  CollectDataUsage();
  EXPECT_EQ(todaysScalars(device), kGrowth);
  EXPECT_EQ(jsonOf(baseline(device)), after);
}

TEST(DataUsage, GrowthWaitsForABaselineThatCanBeWrittenAndCountersThatCanBeRead) {
  TestDevice device(usage(record(kApp, kToday, counters(4096, 0, 0, 0))));
  for (const char* inTheWay :
       {"var/mobile/Library/Preferences", "var/mobile/Library/Tallybook/TBDataStore.sqlitedb"}) {
    SCOPED_TRACE(inTheWay);
    device.endProcess();
    std::filesystem::remove_all(device.path("var"));
    device.write(std::string(inTheWay) + (inTheWay[19] == 'P' ? "" : "/folder"), "");
    device.platform();
    CollectDataUsage();
    device.endProcess();
    std::filesystem::remove_all(device.path(inTheWay));
    device.platform();
    EXPECT_EQ(todaysScalars(device), Scalars{});
    CollectDataUsage();
    EXPECT_EQ(todaysScalars(device), kGrowth);
  }
}

TEST(DataUsage, ANameThatNoDocumentCanCarryCostsOnlyItself) {
  TestDevice device(
      usage(record(R"("procName": "bad\u0001name")", kToday, counters(9999, 0, 0, 0)) + "," +
            record(kApp, kToday, counters(4096, 0, 0, 0))));
  for (int run = 0; run < 2; ++run) {
    CollectDataUsage();
    EXPECT_EQ(todaysScalars(device), kGrowth);
    EXPECT_EQ(jsonOf(baseline(device)),
              R"({"app":[{"date":"2024-03-05T00:00:00.5Z"},4096,0,0,0]})");
  }
}

}  // namespace
}  // namespace vesprun
