#include "driver/TaskingSync.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>

#include "support/Documents.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre, ::testing::SizeIs;

const std::string kMobile = "var/mobile/Library/Preferences/";
const std::string kOwn = kMobile + "com.quill.aggregated.vesprun.ptree";
const std::string kSchedule = "Library/Logsmith/com.quill.Ferrywell.ptree";
const std::string kChanged[] = {kMobile + "com.a.ptree", "Library/Logsmith/com.b.ptree",
                                "var/root/Library/Preferences/com.c.ptree"};
/// The value of a text with single quotes.
PropertyValue json(std::string text) {
  std::replace(text.begin(), text.end(), '\'', '"');
  return valueOfJson(text);
}

PropertyValue sameBuildAnd(const std::string& entries) {
  return json("{'LastOSUpdate': {'version': '2B'}" + (entries.empty() ? "" : ", " + entries) + '}');
}

std::string payload(const std::string& change) {
  return ", 'TaskingPayload': [{'User': 'mobile', 'Domain': 'com.a', 'Key': " + change +
         "}, {'User': '__logsmith__', 'Domain': 'com.b', 'Key': " + change +
         "}, {'User': 'root', 'Domain': 'com.c', 'Key': " + change + "}]";
}

struct TaskingDevice : TestDevice {
  TaskingDevice()
      : TestDevice(R"({"clock": "2024-03-05T09:15:02Z", "system": {"buildVersion": "2B"},
                       "logBlacklist": ["101", "102", "101"]})") {}

  void store(const std::string& file, const PropertyValue& values) const {
    write(file, ptreeOf(values));
  }
  PropertyValue stored(const std::string& file) const { return valueOfPtree(read(file)); }
  void sync() {
    syncTaskingAndOSChange();
    endProcess();
  }
};

TEST(TaskingSync, AppliesUndoesAndKeepsByWhatIsStoredAndScheduled) {
  const std::string old = payload("'old', 'Value': 0");
  const std::string next = payload("'new', 'Value': ['x', 2.5]");
  const struct {
    std::string stored, scheduled, storedAfter, changedAfter, log;
    std::size_t notifications;
  } kCases[] = {
      {"", "", "", "'old': 0", "", 0},
      {"'TaskingID': 1" + old, "'x': 1" + next, "'TaskingID': 1" + old, "'old': 0", "", 0},
      {"", "'TaskingID': 'n'" + next, "'TaskingOS': '2B', 'TaskingID': 'n'" + next,
       "'old': 0, 'new': ['x', 2.5]", "", 1},
      {"'TaskingID': 1, 'TaskingOS': '2B'" + old, "'TaskingID': 1.0" + next,
       "'TaskingID': 1, 'TaskingOS': '2B'" + old, "'old': 0", "", 0},
      {"'TaskingID': 'n', 'TaskingOS': '2A'" + old, "'TaskingID': 'n', 'TaskingDigest': 'd'" + next,
       "'TaskingOS': '2B', 'TaskingID': 'n', 'TaskingDigest': 'd'" + next, "'new': ['x', 2.5]",
       "n -> n, 2A -> 2B", 1},
      {"'TaskingID': 'o', 'TaskingDigest': 7, 'TaskingOS': '2B'" + old, "'TaskingID': ['n']" + next,
       "'TaskingOS': '2B', 'TaskingID': ['n']" + next, "'new': ['x', 2.5]", "o -> (n), 2B -> 2B",
       1},
      {"", "'TaskingID': 'n'", "", "'old': 0", "", 1},
      {"'TaskingID': 'o', 'TaskingDigest': 7, 'TaskingOS': '2A'" + old, "'TaskingID': 'n'",
       "'TaskingOS': '2A'", "", "o -> n, 2A -> 2B", 1},
      {"'TaskingID': 'n'", "'TaskingID': 'n'", "'TaskingID': 'n'", "'old': 0",
       "n -> n, (null) -> 2B", 1},
  };
  for (const auto& [stored, scheduled, storedAfter, changedAfter, log, notifications] : kCases) {
    SCOPED_TRACE(stored + " / " + scheduled);
    TaskingDevice device;
    device.store(kOwn, sameBuildAnd(stored));
    device.store(kSchedule, json("{'ScheduledTasking': {" + scheduled + "}}"));
    for (const std::string& file : kChanged) {
      device.store(file, json("{'old': 0}"));
    }
    syncTaskingAndOSChange();
    // Not left to the end of the process.
    EXPECT_EQ(device.stored(kOwn), sameBuildAnd(storedAfter));
    for (const std::string& file : {kChanged[0], kChanged[2]}) {
      EXPECT_EQ(device.stored(file), json('{' + changedAfter + '}')) << file;
    }
    device.endProcess();
    EXPECT_EQ(device.stored(kChanged[1]), json('{' + changedAfter + '}'));
    EXPECT_EQ(::testing::PrintToString(device.log()),
              log.empty() ? "{}" : "{ \"default: Tasking update (" + log + ")\" }");
    EXPECT_THAT(device.lines("notifications.jsonl"), SizeIs(notifications));
  }
}

TEST(TaskingSync, RecordsThatNameNothingChangeNothing) {
  TaskingDevice device;
  device.store(kOwn, sameBuildAnd(""));
  device.store(kSchedule, json(R"({'ScheduledTasking': {'TaskingID': 'n', 'TaskingPayload': [
      'no record', {'User': 5, 'Domain': 'a', 'Key': 'k', 'Value': 1},
      {'User': 'mobile', 'Key': 'k', 'Value': 1}, {'User': 'mobile', 'Domain': '../a', 'Key': 'k'},
      {'User': 'mobile', 'Domain': 'a', 'Value': 1}, {'User': '../mobile', 'Domain': 'a', 'Key': 'k'},
      {'User': 'root', 'Domain': '../../a', 'Key': 'k', 'Value': 1},
      {'User': '__logsmith__', 'Domain': 'a/b', 'Key': 'k', 'Value': 1},
      {'User': '__logsmith__', 'Domain': 'com.b', 'Key': 'old'}]}})"));
  device.store(kChanged[1], json("{'old': 0}"));
  device.sync();
  EXPECT_THAT(device.log(), SizeIs(7));
  EXPECT_EQ(device.stored(kChanged[1]), json("{}"));
  EXPECT_THAT(device.names("var"), ElementsAre("mobile"));
  EXPECT_THAT(device.names(kMobile), ElementsAre("com.quill.aggregated.vesprun.ptree"));
}

TEST(TaskingSync, OSChangesAndDisabledLogsAreToldWithoutATasking) {
  const std::string cases[][4] = {{"{}", "(null)", "'103'", "['101', '102', '101']"},
                                  {"{'LastOSUpdate': '2B'}", "(null)", "[]", "[]"},
                                  {"{'LastOSUpdate': {'version': '1A', 'day': 5}}", "1A",
                                   "['9', 9, '8', {'a': 1, 'b': [2]}, '9', true, 9.0, {'b': [2.0], "
                                   "'a': 1.0}, [0], [-0.0], true]",
                                   "['9', 9, '8', {'a': 1, 'b': [2]}, true, [0]]"}};
  for (const auto& [own, from, disabled, sent] : cases) {
    TaskingDevice device;
    device.store(kOwn, json(own));
    device.store(kMobile + "com.quill.da.ptree", json("{'disabledLogs': " + disabled + '}'));
    device.sync();
    EXPECT_EQ(device.stored(kOwn), json("{'LastOSUpdate': {'version': '2B', 'day': 19787}}"));
    EXPECT_THAT(device.log(),
                ElementsAre("default: OS change since last run (" + from + " -> 2B)"));
    PropertyArray found;
    for (const PropertyDict& line : device.lines("events.jsonl")) {
      EXPECT_EQ(*line.find("event"), PropertyValue("com.quill.logsmith.disabledLogs"));
      found.push_back(*line.find("payload")->dict()->find("bugType"));
    }
    EXPECT_EQ(PropertyValue(found), json(sent));
    EXPECT_THAT(device.lines("notifications.jsonl"), SizeIs(0));
  }
}

}  // namespace
}  // namespace vesprun
