#include <sys/stat.h>

#include <filesystem>
#include <regex>
#include <vector>

#include "platform/host/outbox/LogPruning.h"
#include "vespctl/VespctlTest.h"

namespace vesprun {
namespace {

using ::testing::AllOf, ::testing::ElementsAre, ::testing::HasSubstr, ::testing::StartsWith;

/// A device whose whitelist lets "s" and "d" through and whose clock the test sets. Day 19787 is
/// 2024-03-05.
class DaysTest : public VespctlTest {
 protected:
  DaysTest() {
    writePtree(kWhitelist, R"({"G": {"ScalarKeys": {"s": {}, "com.quill.kernel.swapusage": {}},
                                     "DistributionKeys": {"d": {"intervals": [0.5]}}}})");
    setTime("2024-03-05T09:15:02Z");
  }

  void setTime(const std::string& time, const std::string& submission = "{}") {
    folder.write("device/device.json",
                 R"({"system": {"osVersion": "1"}, "registry": [], "timeZone": "UTC",
                     "kernel": {"variables": {"kern.bootsessionuuid": "0"}}, "submission": )" +
                     submission + R"(, "clock": ")" + time + "\"}");
  }

  /// Scalars of these days.
  void count(int first, int last) {
    std::string lines;
    for (int day = first; day <= last; ++day) {
      lines += "scalar\t" + std::to_string(day) + "\ts\t" + std::to_string(day) + "\n";
    }
    import(lines);
  }

  /// A daily log of a day of March 2024 that was written at midnight of a date.
  void addLog(int number, int day, const std::string& written) {
    const std::string name = logs + "/000" + std::to_string(number) + "-193-log-aggregated.ptree";
    const std::string date = R"({"date": "2024-03-0)" + std::to_string(day) + R"(T00:00:00Z"})";
    writePtree(name, R"({"TBStartDate": )" + date + R"(, "TBLogCreationDate": )" + date +
                         R"(, "TBWhitelistDigest": "", "TBScalars": {}, "TBDistributions": {},
                             "TBDistributionsHistogram": {}})");
    shell("touch -d " + written + "T00:00Z " + name);
  }

  /// Day and revision of each exported log.
  std::string revisions() {
    return print(R"(export --device n | sed -E 's/^\{"version":2,"device":"n","day":([0-9]+),)"
                 R"("revision":([0-9]+),.*/\1:\2/' | paste -sd ' ')");
  }

  const std::string logs = "device/outbox/logs";
};

TEST_F(DaysTest, DaysTellsWhatIsKeptAndChangesNothing) {
  EXPECT_EQ(
      print("days --json --last 1"),
      "{\"day\":19787,\"date\":\"2024-03-05\",\"scalars\":0,\"distributions\":0,\"logs\":[]}\n");
  count(19785, 19786);
  print("counters sample d 1 2 --day 19785");
  addLog(1, 4, "2024-03-05");
  addLog(2, 4, "2024-03-05");
  addLog(3, 1, "2024-03-05");
  folder.write(logs + "/0004-193-log-aggregated.ptree", "torn");
  print(
      "prefs set com.quill.aggregated.vesprun "
      "LastCrashLogSerializationDateInDaysSince1970 19787");
  const std::string before = snapshot();
  EXPECT_EQ(print("days --json --last 3"),
            R"({"day":19785,"date":"2024-03-03","scalars":1,"distributions":1,"logs":[]}
{"day":19786,"date":"2024-03-04","scalars":1,"distributions":0,"logs":["0001-193-log-aggregated.ptree","0002-193-log-aggregated.ptree"]}
{"day":19787,"date":"2024-03-05","scalars":0,"distributions":0,"logs":[]}
)");
  EXPECT_THAT(error, AllOf(HasSubstr("vespctl days: 0004-193-log-aggregated.ptree: line 1"),
                           HasSubstr("the day of the last run, 19787, is ahead of the clock")));
  EXPECT_EQ(print("days --json --last 0"), "");
  EXPECT_THAT(print("days --json"), StartsWith("{\"day\":19774,"));
  EXPECT_EQ(snapshot(), before);
}

TEST_F(DaysTest, CatchUpSubmitsWhatTheRunOfEachDayWouldHave) {
  count(19784, 19790);
  print("counters sample d 1 0.1 7e300 --day 19785");
  print("counters set com.quill.kernel.swapusage 1 --day 19785");
  print("prefs set com.quill.aggregated DatabaseCorruptionCount 3");
  setTime("2024-03-03T04:00:00Z");
  print("run -- -d");
  print("run -- -d");
  shell("cp -a device kept");
  for (const char* const day : {"04", "05", "06"}) {
    setTime("2024-03-" + std::string(day) + "T04:00:00Z");
    print("run -- -d");
  }
  // By the number of the log, without what tells of the moment.
  const auto documents = [this](bool measured) {
    const std::regex creation("(TBLogCreationDate</key>\\s*<date>)[^<]*");
    const std::regex own("\\s*<key>com.quill.kernel.swapusage</key>\\s*<integer>\\d+</integer>");
    std::vector<std::string> found;
    for (const std::string& name : folder.names(logs)) {
      if (name.ends_with("-193-log-aggregated.ptree") && !name.starts_with("0001")) {
        const std::string text = folder.read(logs + '/' + name);
        EXPECT_EQ(std::regex_search(text, own), measured) << text;
        found.push_back(std::regex_replace(std::regex_replace(text, creation, "$1"), own, ""));
      }
    }
    return found;
  };
  const std::vector<std::string> ofRuns = documents(true);
  EXPECT_EQ(ofRuns.size(), 3U);
  std::filesystem::remove_all(folder.path("device"));
  std::filesystem::rename(folder.path("kept"), folder.path("device"));
  setTime("2024-03-07T04:00:00Z");
  const std::string events = folder.read("device/outbox/events.jsonl");
  const auto whileARunIsAtWork = [&](const std::string& command) {
    return print(
        "days --json --last 0; rm -f held released; (flock \"$D\" sh -c 'touch held; sleep 0.5; "
        "touch released' & until test -e held; do sleep 0.01; done; '" VESPCTL_PROGRAM "' " +
        command + "; test -e released)");
  };
  EXPECT_EQ(whileARunIsAtWork("catch-up --json --last 3"), "[19785,19786,19787]\n");
  EXPECT_EQ(documents(false), ofRuns);
  EXPECT_EQ(folder.read("device/outbox/events.jsonl"), events);
  EXPECT_EQ(print("prefs get --json com.quill.aggregated DatabaseCorruptionCount"), "3\n");
  EXPECT_EQ(print("prefs get --json com.quill.aggregated.vesprun "
                  "LastCrashLogSerializationDateInDaysSince1970"),
            "19784\n");
  EXPECT_EQ(print("catch-up --json"), "[]\n");
  EXPECT_THAT(whileARunIsAtWork("prune --json --outbox-size 0"),
              HasSubstr("0004-193-log-aggregated.ptree"));
  EXPECT_EQ(print("catch-up --json --last 4294967295"), "[]\n") << "pruned is not missed";
}

TEST_F(DaysTest, CatchUpSaysWhichDaysCouldNotBeSubmitted) {
  count(19783, 19786);
  print("counters set other 1 --day 19781");
  setTime("2024-03-05T09:15:02Z", R"({"fails": true})");
  EXPECT_EQ(run("catch-up --json"), 1);
  EXPECT_EQ(output, "[]\n");
  EXPECT_EQ(error,
            "vespctl catch-up: not submitted: 19783, 19784, 19785; \"vespctl show log --last 20\" "
            "says why\n");
  setTime("2024-03-05T09:15:02Z", R"({"enabled": false})");
  EXPECT_EQ(print("catch-up --json"), "[]\n");
  setTime("2024-03-05T09:15:02Z");
  EXPECT_EQ(print("catch-up --json --last 2"), "[19784,19785]\n");
  EXPECT_EQ(print("catch-up --json"), "[19783]\n") << "nothing of day 19781 may leave";
}

TEST_F(DaysTest, PruneKeepsTheDaysThatAreAskedForOrStillRead) {
  count(19780, 19789);
  print("counters sample d 1 2 --day 19779");
  print("counters sample d 1 2 --day 19785");
  EXPECT_EQ(print("prune --json"),
            "{\"days\":[],\"scalars\":0,\"distributions\":0,\"logs\":[],\"lines\":{}}\n");
  EXPECT_THAT(print("prune --json --counters 4294967295"), StartsWith("{\"days\":[],"));
  EXPECT_EQ(print("prune --json --counters 4"),
            R"({"days":[19779,19780,19781,19782],"scalars":3,"distributions":1,"logs":[],"lines":{}}
)");
  EXPECT_THAT(print("prune --json --counters 0"), StartsWith("{\"days\":[19783,19784],"));
  EXPECT_EQ(print("counters dump"),
            "scalar\t19785\ts\t19785\nsample\t19785\td\t1\t33302\nsample\t19785\td\t2\t33302\n"
            "scalar\t19786\ts\t19786\nscalar\t19787\ts\t19787\nscalar\t19788\ts\t19788\n"
            "scalar\t19789\ts\t19789\n");
}

TEST_F(DaysTest, PruneRemovesOldLogsWithTheirHeadersAndOldLines) {
  count(19786, 19786);
  print("run -- -f");
  print("run -- -f");
  setTime("2024-03-15T09:15:02Z");
  count(19796, 19796);
  print("run -- -f");
  folder.write("device/outbox/events.jsonl",
               R"({"time":"2024-03-12T09:15:01Z"}
{"time":"2024-03-12T09:15:02Z"}
{"time":"2024"}
{"time":1}
[]

{"time":"2024-03-01T00:00:00Z",)");
  folder.write(logs + "/note-193-log-aggregated.ptree", "no log");
  std::filesystem::create_symlink("../events.jsonl", folder.path(logs + "/0002-link.log"));
  ASSERT_EQ(mkfifo(folder.path("device/outbox/records.jsonl").c_str(), 0600), 0);
  EXPECT_EQ(run("prune --json --outbox 3"), 1) << "the pipe is not a file of lines";
  EXPECT_EQ(
      output,
      R"({"days":[],"scalars":0,"distributions":0,"logs":["0001-193-log-aggregated.ptree","0002-193-log-aggregated.ptree"],"lines":{"events.jsonl":1,"log.jsonl":15}}
)");
  EXPECT_THAT(error, HasSubstr("records.jsonl: not a regular file\n"));
  EXPECT_EQ(folder.read("device/outbox/events.jsonl"),
            R"({"time":"2024-03-12T09:15:02Z"}
{"time":"2024"}
{"time":1}
[]

{"time":"2024-03-01T00:00:00Z",)");
  EXPECT_THAT(folder.names(logs), ElementsAre("0002-link.log", "0003-193-log-aggregated.ptree",
                                              "note-193-log-aggregated.ptree"));
  EXPECT_EQ(
      folder.read("device/outbox/pruned.jsonl"),
      R"({"time":"2024-03-15T09:15:02Z","name":"0001-193-log-aggregated.ptree","day":19786,"revision":1}
{"time":"2024-03-15T09:15:02Z","name":"0002-193-log-aggregated.ptree","day":19786,"revision":2}
)");
}

TEST_F(DaysTest, PruneRemovesTheOldestLogsUntilTheOutboxIsSmallEnough) {
  const std::string large(600'000, 'x');
  std::filesystem::create_directories(folder.path(logs + "/0001-165-S.log"));
  folder.write(logs + "/0009-165-S.log", large);
  folder.write(logs + "/10000-165-S.log", large);
  folder.write(logs + "/10000-165-S.header.json", "{}");
  folder.write(logs + "/0010-165-S.header.json", "of a log that is gone");
  folder.write(logs + "/.unfinished-0", "of a run that was killed");
  folder.write("device/outbox/log.jsonl", large);
  EXPECT_EQ(
      print("prune --json --outbox-size 1"),
      R"({"days":[],"scalars":0,"distributions":0,"logs":["0009-165-S.log","0010-165-S.header.json","10000-165-S.log"],"lines":{}}
)");
  EXPECT_THAT(folder.names(logs), ElementsAre("0001-165-S.log"));
  std::filesystem::remove(folder.path(logs + "/0001-165-S.log"));
  EXPECT_THAT(print("prune --json --outbox-size 18446744073709551615"), HasSubstr("\"logs\":[]"));
  count(19786, 19786);
  print("run -- -f");
  EXPECT_THAT(folder.names(logs), ElementsAre("10001-193-log-aggregated.header.json",
                                              "10001-193-log-aggregated.ptree"));
  const auto device = DeviceDirectory::open(folder.path("device"), error)->readOnly();
  int steps = 0;
  LogPruning(device, {}, [&steps] { ++steps; }).removeUntilBelow(0);
  EXPECT_EQ(steps, 2) << "one log is read and removed";
  EXPECT_THAT(print("prune --json --outbox-size 0"),
              HasSubstr("[\"10001-193-log-aggregated.ptree\"]"));
}

TEST_F(DaysTest, PruneBelievesAJumpOfTheClockOnTheSecondDay) {
  count(19700, 19795);
  const auto removed = [this](const char* date, const std::string& options = "") {
    setTime(std::string(date) + "T09:00:00Z");
    const std::string days = print("prune --json --counters 3" + options);
    return days.substr(0, days.find(']') + 1);
  };
  const std::string nothing = "{\"days\":[]";
  folder.write("device/outbox/.prune-days", "1" + std::string(200, ' '));  // not ours
  EXPECT_NE(removed("2024-02-20"), nothing) << "the first";
  EXPECT_NE(removed("2024-02-27"), nothing);
  EXPECT_EQ(removed("2024-03-06", " --dry-run"), nothing);
  EXPECT_THAT(error, HasSubstr("vespctl prune: the clock is 8 days ahead of the last prune"));
  EXPECT_EQ(removed("2024-03-06"), nothing);
  EXPECT_EQ(removed("2024-03-06"), nothing) << "the same day again";
  EXPECT_NE(removed("2024-02-28"), nothing) << "the clock is back";
  EXPECT_EQ(removed("2024-03-07"), nothing);
  EXPECT_NE(removed("2024-03-08"), nothing) << "a later day";
  EXPECT_EQ(removed("2024-05-08"), nothing);
  const std::string before = snapshot();
  EXPECT_THAT(print("prune --json --counters 3 --dry-run --now"), HasSubstr("19795"));
  EXPECT_EQ(snapshot(), before);
  EXPECT_THAT(removed("2024-05-08", " --now"), HasSubstr("19795"));
}

TEST_F(DaysTest, PruneDryTellsWhatPruneRemovesAndNotesGoWithTheirLogs) {
  setTime("2024-03-05T09:15:02Z");
  count(19785, 19786);
  const std::string database = "device/var/mobile/Library/Tallybook/TBDataStore.sqlitedb";
  for (const char* const end : {"20240101T000000Z", "20240102T000000Z", "20240102T000000Z-2",
                                "20240102T000000Z-2-journal"}) {
    folder.write(database + ".corrupt-" + end, "");
  }
  print("run -- -d");
  print("run -- -f");
  const std::string submitted = folder.read("device/outbox/submitted.jsonl");
  EXPECT_THAT(submitted, HasSubstr(R"({"time":"2024-03-05T09:15:02Z","name":")"));
  EXPECT_EQ(std::ranges::count(submitted, '\n'), 2);
  folder.write("device/outbox/uploaded.jsonl", "{\"name\":\"0000-193-log-aggregated.ptree\"}\n");
  folder.write("device/outbox/log.jsonl", std::string(1'200'000, 'x') + "\n{\"kept\":1}\n");
  const std::string command = "prune --json --outbox 90 --outbox-size 1 --counters 9";
  const std::string before = snapshot();
  const std::string told = print(command + " --dry-run");
  EXPECT_EQ(snapshot(), before);
  EXPECT_THAT(told, HasSubstr("\"logs\":[],\"lines\":{\"log.jsonl\":1}"));
  EXPECT_EQ(print(command), told);
  EXPECT_EQ(folder.read("device/outbox/log.jsonl"), "{\"kept\":1}\n");
  EXPECT_EQ(folder.read("device/outbox/submitted.jsonl"), submitted);
  EXPECT_EQ(folder.read("device/outbox/uploaded.jsonl"), "");
  EXPECT_THAT(folder.names("device/var/mobile/Library/Tallybook"),
              ElementsAre("TBDataStore.sqlitedb"));
  const std::string all = print("prune --json --outbox-size 0 --dry-run");
  EXPECT_THAT(all, HasSubstr("-193-log-aggregated.ptree"));
  EXPECT_EQ(print("prune --json --outbox-size 0"), all);
  EXPECT_THAT(error, HasSubstr("2 of the removed daily logs were never uploaded"));
  EXPECT_EQ(folder.read("device/outbox/submitted.jsonl"), "");
}

TEST_F(DaysTest, RevisionsGoOnAfterPruningWhicheverLogsWent) {
  addLog(1, 5, "2024-03-01");
  addLog(2, 5, "2024-03-04");
  addLog(3, 5, "2024-03-01");
  addLog(4, 4, "2024-03-01");
  EXPECT_EQ(revisions(), "19787:1 19787:2 19787:3 19786:1\n");
  print("prune --json --outbox 2");
  EXPECT_EQ(revisions(), "19787:2\n");
  addLog(5, 5, "2024-03-01");
  addLog(6, 4, "2024-03-04");
  EXPECT_EQ(revisions(), "19787:2 19787:4 19786:2\n");
  // As if killed between the note and the removal.
  const std::string notes =
      folder.read("device/outbox/pruned.jsonl") +
      R"({"time":"2024-03-05T09:15:02Z","name":"0005-193-log-aggregated.ptree","day":19787,"revision":4}
)";
  folder.write("device/outbox/pruned.jsonl", notes + "{\"name\":7}\n\ntorn");
  EXPECT_EQ(revisions(), "19787:2 19787:4 19786:2\n");
  EXPECT_THAT(print("prune --json --outbox 2"), HasSubstr("[\"0005-193-log-aggregated.ptree\"]"));
  EXPECT_EQ(folder.read("device/outbox/pruned.jsonl"), notes + "{\"name\":7}\n\ntorn");
  addLog(7, 5, "2024-03-04");
  EXPECT_EQ(revisions(), "19787:2 19786:2 19787:5\n");
}

TEST_F(DaysTest, PruneKeepsADailyLogThatItCannotNote) {
  addLog(1, 4, "2024-03-01");
  folder.write(logs + "/0002-165-S.log", "");
  folder.write(logs + "/0003-193-log-aggregated.ptree", "no daily log");
  const std::string tooLarge = logs + "/0004-193-log-aggregated.ptree";
  shell("truncate -s 257M " + tooLarge);
  std::filesystem::create_symlink("/dev/full", folder.path("device/outbox/pruned.jsonl"));
  EXPECT_EQ(run("prune --json --outbox-size 0"), 1);
  EXPECT_THAT(error, HasSubstr("pruned.jsonl: "));
  EXPECT_THAT(output, HasSubstr("[\"0002-165-S.log\"]"));
  EXPECT_THAT(folder.names(logs),
              ElementsAre("0001-193-log-aggregated.ptree", "0003-193-log-aggregated.ptree",
                          "0004-193-log-aggregated.ptree"));
  std::filesystem::remove(folder.path("device/outbox/pruned.jsonl"));
  folder.write("device/outbox/pruned.jsonl", "");
  std::filesystem::create_hard_link(folder.path("device/outbox/pruned.jsonl"),
                                    folder.path("second"));
  EXPECT_EQ(run("prune --json --outbox-size 0"), 1);
  EXPECT_THAT(folder.names(logs),
              ElementsAre("0001-193-log-aggregated.ptree", "0004-193-log-aggregated.ptree"));
  std::filesystem::remove(folder.path("second"));
  std::filesystem::remove(folder.path(tooLarge));
  EXPECT_THAT(print("prune --json --outbox-size 0"),
              HasSubstr("[\"0001-193-log-aggregated.ptree\"]"));
  // What cannot be listed has not gone.
  const std::string note = "{\"name\":\"0001-193-log-aggregated.ptree\"}\n";
  folder.write("device/outbox/submitted.jsonl", note);
  std::filesystem::remove(folder.path(logs));
  folder.write(logs, "");
  EXPECT_EQ(run("prune --counters 9"), 1);
  EXPECT_EQ(folder.read("device/outbox/submitted.jsonl"), note);
}

TEST_F(DaysTest, PruneWaitsForTheDailyWorkAndForALogThatIsWritten) {
  addLog(1, 4, "2024-03-01");
  for (const char* const locked : {"device", "device/outbox/logs"}) {
    EXPECT_EQ(run("fields >/dev/null; flock " + std::string(locked) +
                  " timeout 0.3 '" VESPCTL_PROGRAM "' prune --counters 9"),
              124)
        << locked;
    EXPECT_EQ(folder.names(logs).size(), 1U);
  }
}

TEST_F(DaysTest, StatusTellsEachFindingOnceAndChangesNothing) {
  const auto findings = [this] {
    const int status = run("status --json");
    EXPECT_EQ(status == 0 || status == 1 ? error : "failed", "");
    std::string names;
    const std::regex name("\"finding\":\"([^\"]*)\",\"detail\":\"[^\"]");
    for (std::sregex_iterator found(output.begin(), output.end(), name), end; found != end;
         ++found) {
      names += (*found)[1].str() + ';';
    }
    EXPECT_EQ(status, names.empty() ? 0 : 1);
    return names;
  };
  EXPECT_EQ(findings(), "");
  EXPECT_THAT(output, AllOf(HasSubstr(R"("today":19787,"lastReport":null,"nextReport":19786,)"
                                      R"("keysToday":0,"outboxBytes":)"),
                            HasSubstr("\"findings\":[]")));
  EXPECT_THAT(print("status"), HasSubstr("a report of today comes tomorrow"));
  count(19780, 19787);
  EXPECT_EQ(findings(), "missed days;");
  EXPECT_EQ(print("catch-up --dry-run --json"), "[19780,19781,19782,19783,19784,19785]\n");
  EXPECT_THAT(folder.names(logs), ElementsAre());
  EXPECT_EQ(print("catch-up --json"), output);
  EXPECT_EQ(findings(), "");
  EXPECT_THAT(output,
              HasSubstr(R"("lastReport":{"day":19785,"log":"0006-193-log-aggregated.ptree"},)"
                        R"("nextReport":19786,"keysToday":1,)"));
  // Errors count from the start of the last run that did the tasks of a day.
  const auto logged = [](const std::string& level, const std::string& message) {
    return R"({"time":"2024-03-05T09:15:02Z","level":")" + level + R"(","message":")" + message +
           "\"}\n";
  };
  const std::string fault = logged("error", "e");
  folder.write("device/outbox/log.jsonl", fault + logged("default", "vesprun started") +
                                              logged("default", "daily tasks for day 3") +
                                              logged("default", "vesprun started") + "torn\n");
  EXPECT_EQ(findings(), "");
  shell("printf '%s' '" + fault + "' >> device/outbox/log.jsonl");
  EXPECT_EQ(findings(), "errors;");
  // All at once.
  print(
      "prefs set com.quill.aggregated.vesprun LastCrashLogSerializationDateInDaysSince1970 19787");
  writePtree(kWhitelist, R"({"G": {"ScalarKeys": {"linux.cpu.userSeconds": {}}, "Bad": {},
      "ScalarKeyPrefixes": {"s": {"expires": {"date": "2024-03-04T23:00:00Z"}}}}})");
  shell(
      "rm device/outbox/logs/0001*; touch device/var/mobile/Library/Tallybook/"
      "TBDataStore.sqlitedb.corrupt-20240305T091502Z; chmod a-w device/run");
  const std::string before = snapshot();
  EXPECT_EQ(
      findings(),
      "not writable;damaged database;faulty whitelist;expired keys;stored day ahead;missed days;"
      "no collection;errors;");
  EXPECT_EQ(snapshot(), before);
  print("collect");
  print("collect");
  writePtree(kWhitelist, R"({"G": {"ScalarKeyPrefixes": {"s": {"expires": {"date":
      "2024-03-05T00:00:00Z"}}}, "ScalarKeys": {"linux.cpu.userSeconds": {}}}})");
  EXPECT_EQ(findings(), "not writable;damaged database;stored day ahead;missed days;errors;");
  setTime("2024-03-06T09:15:03Z");
  EXPECT_THAT(findings(), HasSubstr("no collection;"));
  // Without counters and a whitelist that can be read, what rests on them is not told.
  folder.write(kWhitelist, "torn");
  folder.write("device/var/mobile/Library/Tallybook/TBDataStore.sqlitedb", std::string(5000, 'x'));
  EXPECT_EQ(findings(), "not writable;damaged database;no whitelist;errors;");
  EXPECT_THAT(output, AllOf(HasSubstr("\"keysToday\":0,"), HasSubstr("\"whitelist\":null")));
}

TEST_F(DaysTest, ImportReplacesTheDaysItNames) {
  import("scalar\t1\ta\t1\nsample\t1\td\t1\t0\nscalar\t2\tb\t2\nsample\t3\td\t3\t0\n");
  const std::string dump = print("counters dump");
  print("counters add b 1 --day 1; '" VESPCTL_PROGRAM "' counters sample d 5 --day 3");
  folder.write("lines", dump);
  print("counters import --replace lines");
  EXPECT_EQ(print("counters dump"), dump);
  EXPECT_EQ(run("counters import --replace - <<'END'\nscalar\t1\tc\t1\nscalar\t2\tc\n\nEND"), 1);
  EXPECT_THAT(error, StartsWith("vespctl counters import: standard input: line 2: "));
  EXPECT_EQ(print("counters import --replace /dev/null; '" VESPCTL_PROGRAM "' counters dump"),
            dump);
  // A pipe, which can be read once.
  print("counters import --replace - <<'END'\nscalar\t1\tc\t1\nEND");
  EXPECT_EQ(print("counters dump"), "scalar\t1\tc\t1\n" + dump.substr(dump.find("scalar\t2")));
}

}  // namespace
}  // namespace vesprun
